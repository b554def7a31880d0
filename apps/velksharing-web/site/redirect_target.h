#ifndef VELKSHARING_WEB_SITE_REDIRECT_TARGET_H
#define VELKSHARING_WEB_SITE_REDIRECT_TARGET_H

#include <string>
#include <string_view>

namespace web {

/// Whether a text is an absolute http or https address that every browser reads as what it looks
/// like, and that fits a header as it is: scheme, "://", a host name or address, perhaps a port,
/// and behind that only what RFC 3986 allows there. No account names, no blanks, no backslashes,
/// nothing beyond ASCII, at most 2048 characters.
bool IsWebAddress(std::string_view text);

}  // namespace web

#endif
