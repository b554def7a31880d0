#ifndef VELKSHARING_WEB_SERVER_LISTENING_WAIT_H
#define VELKSHARING_WEB_SERVER_LISTENING_WAIT_H

#include "http/unique_fd.h"

namespace web {

/// Waits for connections to a listening socket that other processes wait at, too: a connection
/// wakes one of them, and not all. Any thread may call, one at a time in Wait().
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
  /// Readable after Stop().
  int stop_descriptor() const { return stop_.get(); }
  void Stop();

 private:
  UniqueFd stop_;
  UniqueFd events_;
};

}  // namespace web

#endif
