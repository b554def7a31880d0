#include "secret.h"

#include <algorithm>
#include <cstring>

namespace velk {

Secret::Secret(std::string_view text) : Secret(text.size()) {
  std::copy(text.begin(), text.end(), bytes_.begin());
}

Secret &Secret::operator=(Secret &&other) noexcept {
  bytes_.swap(other.bytes_);
  return *this;
}

Secret::~Secret() {
  if (!bytes_.empty()) explicit_bzero(bytes_.data(), bytes_.size());
}

}  // namespace velk
