#include "operations/secret.h"

#include <string.h>

#include <utility>

namespace operations {

Secret::Secret() : bytes_(kCapacity + 1, '\0') {}

Secret::Secret(Secret &&other) noexcept
    : bytes_(std::move(other.bytes_)), length_(std::exchange(other.length_, 0)) {}

Secret &Secret::operator=(Secret &&other) noexcept {
  if (this == &other) return *this;
  Wipe();
  bytes_ = std::move(other.bytes_);
  length_ = std::exchange(other.length_, 0);
  return *this;
}

Secret::~Secret() {
  Wipe();
}

bool Secret::Append(char byte) {
  if (length_ == kCapacity) return false;
  bytes_[length_++] = byte;
  return true;
}

bool Secret::Equals(const Secret &other) const {
  return length_ == other.length_ && memcmp(c_str(), other.c_str(), length_) == 0;
}

bool Secret::Contains(char byte) const {
  return memchr(c_str(), byte, length_) != nullptr;
}

void Secret::Wipe() {
  if (!bytes_.empty()) explicit_bzero(bytes_.data(), bytes_.size());
  length_ = 0;
}

void Wipe(std::string &text) {
  if (!text.empty()) explicit_bzero(text.data(), text.size());
  text.clear();
}

}  // namespace operations
