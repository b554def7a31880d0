#include "gate/origin.h"

#include <arpa/inet.h>

#include <algorithm>

#include "http/host.h"
#include "http/text.h"

namespace web::gate {
namespace {

struct Scheme {
  std::string_view start;
  int default_port;
};
constexpr Scheme kSchemes[] = {{"https://", 443}, {"http://", 80}};

const Scheme *SchemeOf(std::string_view address) {
  const auto begins_address = [address](const Scheme &scheme) {
    return IsSameText(address.substr(0, scheme.start.size()), scheme.start);
  };
  const auto *const found = std::ranges::find_if(kSchemes, begins_address);
  return found == std::end(kSchemes) ? nullptr : found;
}

std::string InLowerCase(std::string_view text) {
  std::string lower(text);
  for (char &byte : lower)
    if (byte >= 'A' && byte <= 'Z') byte = static_cast<char>(byte - 'A' + 'a');
  return lower;
}

/// @param bracketed one that IsHost() accepts.
std::string ShortenedIPv6(std::string_view bracketed) {
  in6_addr address;
  char text[INET6_ADDRSTRLEN];
  inet_pton(AF_INET6, std::string(bracketed.substr(1, bracketed.size() - 2)).c_str(), &address);
  inet_ntop(AF_INET6, &address, text, sizeof text);
  return std::string("[") + text + "]";
}

std::optional<std::string> CanonicalHost(std::string_view host) {
  if (host.ends_with('.') && !host.starts_with('[')) host.remove_suffix(1);
  if (!IsHost(host)) return std::nullopt;
  return host.starts_with('[') ? ShortenedIPv6(host) : InLowerCase(host);
}

/// What stands behind the host: ":8443", or "" for the scheme's own port.
std::optional<std::string> PortSuffix(std::optional<std::string_view> port, const Scheme &scheme) {
  if (!port || port->empty()) return "";
  const std::optional<int> number = PortNumber(*port);
  if (!number) return std::nullopt;
  return *number == scheme.default_port ? "" : ":" + std::to_string(*number);
}

}  // namespace

std::optional<std::string> TakeOrigin(std::string_view &address) {
  const Scheme *const scheme = SchemeOf(address);
  if (scheme == nullptr) return std::nullopt;
  const std::string_view behind = address.substr(scheme->start.size());
  const std::string_view authority = behind.substr(0, behind.find_first_of("/?#"));
  const HostAndPort parts = SplitHostAndPort(authority);
  const std::optional<std::string> host = CanonicalHost(parts.host);
  const std::optional<std::string> port = PortSuffix(parts.port, *scheme);
  if (!host || !port) return std::nullopt;
  address = behind.substr(authority.size());
  return std::string(scheme->start) + *host + *port;
}

}  // namespace web::gate
