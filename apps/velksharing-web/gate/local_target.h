#ifndef VELKSHARING_WEB_GATE_LOCAL_TARGET_H
#define VELKSHARING_WEB_GATE_LOCAL_TARGET_H

#include <cstddef>
#include <string_view>

namespace web::gate {

constexpr size_t kLongestLocalTarget = 4 * 1024;  ///< Bytes.

/// Whether a text is path and query of a page on the site that a visitor already is on, and stays
/// that in every browser when a redirect names it: begins with one slash and no second, has no
/// backslash, no fragment, whole escapes only, nothing beyond printable ASCII, at most
/// `kLongestLocalTarget` bytes.
bool IsLocalTarget(std::string_view text);

}  // namespace web::gate

#endif
