#ifndef VELKCGI_SECRET_H
#define VELKCGI_SECRET_H

#include <cstddef>
#include <string_view>
#include <vector>

namespace velk {

/// Bytes that are wiped when they go, with a zero byte behind them. Their number never changes, so
/// no copy stays behind in memory that a growing buffer has left. One that was moved from may only
/// be destroyed.
class Secret {
 public:
  /// Zero bytes, to be filled.
  explicit Secret(size_t size) : bytes_(size + 1) {}
  explicit Secret(std::string_view text);
  Secret(const Secret &) = delete;
  Secret &operator=(const Secret &) = delete;
  Secret(Secret &&) = default;
  /// Swaps, so that the bytes there were are wiped with `other`.
  Secret &operator=(Secret &&other) noexcept;
  ~Secret();

  char *data() { return bytes_.data(); }
  size_t size() const { return bytes_.size() - 1; }
  std::string_view view() const { return {bytes_.data(), size()}; }
  const char *c_str() const { return bytes_.data(); }

 private:
  std::vector<char> bytes_;
};

}  // namespace velk

#endif
