#ifndef VELKSHARING_WEB_HTTP_HOST_H
#define VELKSHARING_WEB_HTTP_HOST_H

#include <optional>
#include <string_view>

namespace web {

/// Whether a text is the host of an address that every reader takes for the same one: a name of
/// letters, digits, "-" and "_" in labels, without a dot at its end; an IPv4 address in its usual
/// spelling; or an IPv6 address in brackets.
bool IsHost(std::string_view text);

/// The number that a port is: 1 to 65535, in at most five digits.
/// @return nothing for anything else, "" too.
std::optional<int> PortNumber(std::string_view text);

/// The host and the port of an address, as texts.
struct HostAndPort {
  std::string_view host;
  std::optional<std::string_view> port;  ///< What stands behind the colon; nothing without a colon.
};

/// Splits "host:port" at its colon, which is none of those in an IPv6 address.
HostAndPort SplitHostAndPort(std::string_view authority);

/// Whether host and port, as somebody sent them, reach into nothing that stands behind them in an
/// address: a host "wiki.example/a" or "wiki.example?" would change the path.
bool IsApartFromPath(std::string_view authority);

}  // namespace web

#endif
