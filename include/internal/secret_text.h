#ifndef VELKSHARING_INTERNAL_SECRET_TEXT_H
#define VELKSHARING_INTERNAL_SECRET_TEXT_H

#include <initializer_list>
#include <string>
#include <string_view>

namespace VELK::sharing::internal {

/// A text that is wiped at the end of the scope. Never grows, so that it leaves no copy behind.
class SecretText {
 public:
  /// The pieces, one behind the other.
  explicit SecretText(std::initializer_list<std::string_view> pieces);
  SecretText(const SecretText &) = delete;
  SecretText &operator=(const SecretText &) = delete;
  ~SecretText();

  const std::string &text() const { return text_; }

 private:
  std::string text_;
};

}  // namespace VELK::sharing::internal

#endif
