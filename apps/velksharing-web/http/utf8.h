#ifndef VELKSHARING_WEB_HTTP_UTF8_H
#define VELKSHARING_WEB_HTTP_UTF8_H

#include <cstddef>
#include <string_view>

namespace web {

/// How many bytes the character that `text` begins with has, 1 to 4; 0 when it is not UTF-8: also
/// for overlong forms, surrogates, and a character that is cut in two.
size_t Utf8CharacterLength(std::string_view text);

/// The length of the longest beginning of `text` that is UTF-8.
size_t Utf8Length(std::string_view text);

/// Whether `rest` could be the beginning of a character that has been cut in two.
bool IsCutUtf8Character(std::string_view rest);

}  // namespace web

#endif
