#ifndef OPERATIONS_SECRET_H
#define OPERATIONS_SECRET_H

#include <cstddef>
#include <string>
#include <vector>

namespace operations {

/// A password or session identifier while it is being used: one buffer that is never copied or
/// moved in memory, and is overwritten at the end of its life.
class Secret {
 public:
  /// The most bytes that a secret may have.
  static constexpr std::size_t kCapacity = 4096;

  Secret();
  Secret(const Secret &) = delete;
  Secret &operator=(const Secret &) = delete;
  Secret(Secret &&other) noexcept;
  Secret &operator=(Secret &&other) noexcept;
  ~Secret();

  /// @return false, with nothing added, when the secret is full.
  bool Append(char byte);

  bool Equals(const Secret &other) const;
  bool Contains(char byte) const;

  bool empty() const { return length_ == 0; }
  std::size_t length() const { return length_; }
  const char *c_str() const { return bytes_.data(); }

 private:
  void Wipe();

  std::vector<char> bytes_;
  std::size_t length_ = 0;
};

/// Overwrites a text and empties it.
void Wipe(std::string &text);

}  // namespace operations

#endif
