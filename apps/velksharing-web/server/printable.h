#ifndef VELKSHARING_WEB_SERVER_PRINTABLE_H
#define VELKSHARING_WEB_SERVER_PRINTABLE_H

#include <string>
#include <string_view>

namespace web {

/// Text from outside, fit for one word of a log line: blanks, control bytes, quotes, backslashes
/// and all that is not ASCII become "\xHH". "-" for an empty text.
/// @param longest in bytes of `text`; what is longer ends in "...".
std::string Printable(std::string_view text, size_t longest = 64);

}  // namespace web

#endif
