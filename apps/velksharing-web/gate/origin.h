#ifndef VELKSHARING_WEB_GATE_ORIGIN_H
#define VELKSHARING_WEB_GATE_ORIGIN_H

#include <optional>
#include <string>
#include <string_view>

namespace web::gate {

/// Takes scheme, host and port away from the front of an absolute http or https address and brings
/// them into the one form that all their spellings share: "HTTPS://Wiki.Example.:443/a" leaves "/a"
/// and gives "https://wiki.example". Lower case, no dot at the host's end, IPv6 shortened, no
/// default port.
/// @return nothing, with `address` as it was, for another scheme, an account before the host, a
///         host that is none (IDNs stand in their ASCII form) and a port beyond 1 to 65535; a colon
///         without a port means the default port.
std::optional<std::string> TakeOrigin(std::string_view &address);

}  // namespace web::gate

#endif
