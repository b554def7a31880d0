#ifndef VELKSHARING_WEB_SERVER_RECEPTION_H
#define VELKSHARING_WEB_SERVER_RECEPTION_H

#include <atomic>
#include <mutex>
#include <semaphore>
#include <vector>

#include "http/unique_fd.h"
#include "server/listening_wait.h"

namespace web {

/// The threads of one process that take connections from a listening socket. One of them looks at
/// the socket, or a connection would wake them all. Once it has taken one, its place goes to the
/// thread that began to wait last: that one's memory is still in the processor's caches. (A mutex
/// would go through all the threads in turn.)
class Reception {
 public:
  /// A thread's part. Outlives the reception's use by other threads.
  class Clerk {
   private:
    friend class Reception;
    std::binary_semaphore is_called_{0};
  };

  /// @param listening_socket must outlive this, does not block.
  /// @throws std::runtime_error when the kernel has no descriptors left.
  explicit Reception(int listening_socket) : wait_(listening_socket) {}
  Reception(const Reception &) = delete;
  Reception &operator=(const Reception &) = delete;

  /// Waits for a connection, and takes it.
  /// @return one that is not open when another process was faster, and soon after Stop().
  UniqueFd Accept(Clerk &clerk);
  /// Whether no thread waits for a connection.
  bool IsEmpty() const { return waiting_threads_ == 0; }

  /// Readable after Stop().
  int stop_descriptor() const { return wait_.stop_descriptor(); }
  void Stop() { wait_.Stop(); }

 private:
  void TakePlace(Clerk &clerk);
  void GivePlace();

  ListeningWait wait_;
  std::atomic<int> waiting_threads_ = 0;
  std::mutex mutex_;  ///< Of what follows.
  bool is_taken_ = false;
  std::vector<Clerk *> queue_;  ///< For the place, which is taken then.
};

}  // namespace web

#endif
