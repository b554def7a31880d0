#ifndef COMMON_ADDRESS_H
#define COMMON_ADDRESS_H

#include <netinet/in.h>

#include <optional>
#include <string>

namespace velk {

/// An IP address. Only the member that `family` names is set.
struct Address {
  int family = AF_UNSPEC;  ///< AF_INET or AF_INET6.
  in_addr v4{};
  in6_addr v6{};
};

/// Reads an IPv4 or IPv6 address. An IPv4 address written as IPv6 ("::ffff:192.0.2.1") becomes
/// IPv4; a zone id ("fe80::1%eth0") is dropped.
/// @return nothing when `text` is null or anything else than one address.
std::optional<Address> ParseAddress(const char *text);

/// The one text form of an address, as the C library prints it.
std::string PrintAddress(const Address &address);

}  // namespace velk

#endif
