#ifndef COMMON_TEXT_H
#define COMMON_TEXT_H

#include <cstddef>
#include <string_view>

namespace velk {

/// `text` without any of `blanks` at its ends.
std::string_view Trim(std::string_view text, std::string_view blanks);

/// Copies `text` and a terminating zero to a caller's buffer.
/// @return false, with `out` left alone, when that is null or has no room for them.
bool CopyText(std::string_view text, char *out, size_t capacity);

}  // namespace velk

#endif
