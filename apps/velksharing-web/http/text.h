#ifndef VELKSHARING_WEB_HTTP_TEXT_H
#define VELKSHARING_WEB_HTTP_TEXT_H

#include <string_view>

/// What every reader of header fields and addresses needs. ASCII only, whatever the locale says.

namespace web {

bool IsDigit(char byte);
bool IsLetterOrDigit(char byte);
/// @return 0 to 15, or -1 for what is no hexadecimal digit.
int HexDigitValue(char byte);

/// Whether two texts differ in upper and lower case at most.
bool IsSameText(std::string_view one, std::string_view other);
/// The text without blanks and tabs at its ends.
std::string_view Trimmed(std::string_view text);
/// Takes what stands before the first `separator`, and the separator, away from `text`; everything
/// when there is none.
/// @return what stood before it.
std::string_view TakePart(std::string_view &text, char separator);

}  // namespace web

#endif
