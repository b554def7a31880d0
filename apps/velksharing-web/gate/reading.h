#ifndef VELKSHARING_WEB_GATE_READING_H
#define VELKSHARING_WEB_GATE_READING_H

#include <string>
#include <string_view>
#include <vector>

namespace web::gate {

/// A path as one kind of server reads it: a row of components. A component may hold any byte but
/// control characters, also a slash, which then is a letter of it; it may be empty, "." or "..",
/// for there are servers that look no closer. A value; "/" has no components.
class Reading {
 public:
  /// Stands before each component in text().
  static constexpr char kSeparator = '\0';

  /// @param text as text() gives it.
  explicit Reading(std::string text);

  /// Whether this is `other`, or lies below it: by whole components, case counts.
  bool LiesBelow(const Reading &other) const;

  std::vector<std::string> components() const;
  /// The components, each behind a separator: "\0photos\0a"; "" for "/".
  const std::string &text() const { return text_; }

  bool operator==(const Reading &) const = default;

 private:
  std::string text_;
};

/// Whether browsers send this byte of a path as it is: letters, digits and "-._~!$&'()*+,;=:@[]|".
/// An escape of such a byte is one without need.
bool IsPlainInPath(char byte);

/// The components as a browser sends them, each behind a slash: "/my%20photos/@a"; "/" for none.
std::string EncodedPath(const std::vector<std::string> &components);

}  // namespace web::gate

#endif
