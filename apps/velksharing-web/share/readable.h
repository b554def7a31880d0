#ifndef VELKSHARING_WEB_SHARE_READABLE_H
#define VELKSHARING_WEB_SHARE_READABLE_H

#include <string>
#include <string_view>

namespace web::share {

/// A file name as text: bytes that are not UTF-8 are taken for Latin-1, as old systems wrote them,
/// and control characters become '_'. UTF-8 without them stays as it is.
std::string Readable(std::string_view name);

}  // namespace web::share

#endif
