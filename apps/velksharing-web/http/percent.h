#ifndef VELKSHARING_WEB_HTTP_PERCENT_H
#define VELKSHARING_WEB_HTTP_PERCENT_H

#include <optional>
#include <string>
#include <string_view>

namespace web {

/// Decodes the percent-escapes of one part of a path. Each "%" must begin an escape of two
/// hexadecimal digits; a plus sign is a plus sign. Any byte may come out, zero too.
/// @return nothing for a broken escape and for a control character or blank that is not escaped.
std::optional<std::string> PercentDecode(std::string_view text);

/// The same, behind what `out` holds. Where `out` has room for as many bytes as `text` has, it does
/// not move, and so leaves no copy behind.
/// @return false where PercentDecode() gives nothing; `out` is then decoded in part.
bool AppendPercentDecoded(std::string_view text, std::string &out);

/// Encodes a text for one component of a path or for a value in a query: letters, digits and
/// "-._~" stay as they are, every other byte becomes an escape.
std::string PercentEncode(std::string_view text);

}  // namespace web

#endif
