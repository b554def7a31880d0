#ifndef VELKSHARING_WEB_SERVER_CONNECTION_WATCH_H
#define VELKSHARING_WEB_SERVER_CONNECTION_WATCH_H

#include <sys/types.h>

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <optional>
#include <thread>

#include "http/unique_fd.h"

namespace web {

/// Cuts connections on which nothing good can come any more: those whose visitor does not finish
/// what he began to send (one who sends a byte now and then would never run into a time-out of
/// silence), and those on which a file is sent that has become shorter (the kernel then sends
/// nothing, and reports no error). Any thread may call.
class ConnectionWatch {
 public:
  /// @param patience how long a visitor may take to send what is expected.
  explicit ConnectionWatch(std::chrono::milliseconds patience);
  ConnectionWatch(const ConnectionWatch &) = delete;
  ConnectionWatch &operator=(const ConnectionWatch &) = delete;
  ~ConnectionWatch();

  /// From now on the visitor has the whole patience.
  void Expect(int socket);
  /// From now on a file is sent, as far as `end`. Nothing is expected of the visitor.
  void WatchFile(int socket, UniqueFd file, off_t end);
  /// Nothing is watched any more. Also to be called before the socket is closed.
  void Forget(int socket);

 private:
  using Clock = std::chrono::steady_clock;

  /// What a connection must not come to.
  struct Limit {
    std::optional<Clock::time_point> deadline;
    UniqueFd file;
    off_t end = 0;
  };

  void Set(int socket, Limit limit);
  void Watch();
  void CutHopeless();
  static bool IsHopeless(const Limit &limit);

  const std::chrono::milliseconds patience_;
  std::mutex mutex_;
  std::condition_variable is_over_changed_;
  bool is_over_ = false;
  std::map<int, Limit> limits_;
  std::thread watch_;
};

}  // namespace web

#endif
