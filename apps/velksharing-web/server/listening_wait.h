#ifndef VELKSHARING_WEB_SERVER_LISTENING_WAIT_H
#define VELKSHARING_WEB_SERVER_LISTENING_WAIT_H

#include <sys/socket.h>

#include "http/unique_fd.h"

namespace web {

/// Waits for connections to a listening socket that other processes wait at, too: a connection
/// wakes one of them, and not all. Any thread may call, one at a time in Wait() and Accept().
class ListeningWait {
 public:
  /// @param listening_socket must outlive this, does not block.
  /// @throws std::runtime_error when the kernel has no descriptors left.
  explicit ListeningWait(int listening_socket);
  ListeningWait(const ListeningWait &) = delete;
  ListeningWait &operator=(const ListeningWait &) = delete;

  /// @return true when a connection may be there to be accepted (another process may be faster);
  ///         false, from now on, after Stop().
  bool Wait() const;
  /// Takes a connection, which is closed in programs that this one starts.
  /// @param flags further ones of accept4().
  /// @param[out] peer, size the other end's address; may be null.
  /// @return one that is not open when another process was faster. Where the machine lacks what a
  ///         connection needs, the log says so, and a while passes.
  UniqueFd Accept(int flags, sockaddr *peer, socklen_t *size) const;

  /// Readable after Stop().
  int stop_descriptor() const { return stop_.get(); }
  void Stop();

 private:
  const int listening_socket_;
  UniqueFd stop_;
  UniqueFd events_;
};

}  // namespace web

#endif
