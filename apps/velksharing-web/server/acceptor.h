#ifndef VELKSHARING_WEB_SERVER_ACCEPTOR_H
#define VELKSHARING_WEB_SERVER_ACCEPTOR_H

#include <sys/socket.h>

#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

#include "http/unique_fd.h"
#include "server/listening_wait.h"

namespace web {

/// Takes connections from a listening socket that other processes share, on a thread of its own,
/// and no more at a time than there is room for: the rest is left to the others, or waits.
class Acceptor {
 public:
  /// Gets a new connection and owns it.
  using Taker = std::function<void(UniqueFd connection, const sockaddr *peer, socklen_t size)>;

  /// @param listening_socket does not block.
  /// @param room how many connections at a time.
  Acceptor(int listening_socket, int room, Taker take);
  Acceptor(const Acceptor &) = delete;
  Acceptor &operator=(const Acceptor &) = delete;
  ~Acceptor();

  /// Begins; Release() may be called from then on.
  void Start();
  /// One that was taken is closed. Any thread may call.
  void Release();
  /// Takes no more; the listening socket is not used any more after this.
  void Stop();

 private:
  void Run();
  bool WaitForRoom();
  void AcceptOne();

  const Taker take_;
  ListeningWait wait_;
  std::mutex mutex_;
  std::condition_variable changed_;
  int room_;
  bool is_stopping_ = false;
  std::thread thread_;
};

}  // namespace web

#endif
