#ifndef VELKCGI_SECRET_H
#define VELKCGI_SECRET_H

#include <cstddef>
#include <string_view>
#include <vector>

namespace velk {

/// Bytes that are wiped when they go. Their number never changes, so no copy stays behind in
/// memory that a growing buffer has left.
class Secret {
 public:
  explicit Secret(size_t size) : bytes_(size) {}
  Secret(const Secret &) = delete;
  Secret &operator=(const Secret &) = delete;
  Secret(Secret &&) = default;
  Secret &operator=(Secret &&) = delete;
  ~Secret();

  char *data() { return bytes_.data(); }
  size_t size() const { return bytes_.size(); }
  std::string_view view() const { return {bytes_.data(), bytes_.size()}; }

 private:
  std::vector<char> bytes_;
};

}  // namespace velk

#endif
