#ifndef VELKSHARING_WEB_HTTP_UNIQUE_FD_H
#define VELKSHARING_WEB_HTTP_UNIQUE_FD_H

#include <unistd.h>

#include <utility>

namespace web {

/// Owns a file descriptor.
class UniqueFd {
 public:
  UniqueFd() = default;
  explicit UniqueFd(int fd) : fd_(fd) {}
  UniqueFd(const UniqueFd &) = delete;
  UniqueFd(UniqueFd &&other) noexcept : fd_(other.Release()) {}
  UniqueFd &operator=(const UniqueFd &) = delete;
  UniqueFd &operator=(UniqueFd &&other) noexcept {
    if (this != &other) Reset(other.Release());
    return *this;
  }
  ~UniqueFd() { Reset(); }

  bool IsOpen() const { return fd_ >= 0; }
  int get() const { return fd_; }
  /// Gives the descriptor away.
  int Release() { return std::exchange(fd_, -1); }
  /// Closes the descriptor and owns another one.
  void Reset(int fd = -1) {
    if (fd_ >= 0) close(fd_);
    fd_ = fd;
  }

 private:
  int fd_ = -1;
};

}  // namespace web

#endif
