#ifndef VELKSHARING_WEB_HTTP_WIPE_H
#define VELKSHARING_WEB_HTTP_WIPE_H

#include <string>
#include <string_view>

namespace web {

/// Overwrites the text's memory and empties it. For what held a password or a session identifier.
void Wipe(std::string &text);

/// A text that is wiped at the end of the scope.
class Secret {
 public:
  Secret() = default;
  explicit Secret(std::string_view text);
  Secret(const Secret &) = delete;
  Secret &operator=(const Secret &) = delete;
  ~Secret();

  const std::string &text() const { return text_; }
  std::string &text() { return text_; }

 private:
  std::string text_;
};

}  // namespace web

#endif
