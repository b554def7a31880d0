#ifndef VELKCORE_DESCRIPTOR_H
#define VELKCORE_DESCRIPTOR_H

#include <unistd.h>

#include <cerrno>
#include <utility>

namespace velkcore {

/// Owns one file descriptor, or none (-1), and closes it without touching errno, so that an error
/// on its way to the caller survives the clean-up.
class Descriptor {
 public:
  explicit Descriptor(int number = -1) : number_(number) {}
  Descriptor(Descriptor &&other) noexcept : number_(other.Release()) {}
  Descriptor &operator=(Descriptor &&other) noexcept {
    std::swap(number_, other.number_);
    return *this;
  }
  ~Descriptor() {
    if (number_ == -1) return;
    const int saved_errno = errno;
    close(number_);
    errno = saved_errno;
  }

  /// Hands the descriptor over to the caller.
  int Release() { return std::exchange(number_, -1); }

  bool IsOpen() const { return number_ != -1; }
  int number() const { return number_; }

 private:
  int number_;
};

}  // namespace velkcore

#endif
