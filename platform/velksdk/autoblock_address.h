#ifndef VELKSDK_AUTOBLOCK_ADDRESS_H
#define VELKSDK_AUTOBLOCK_ADDRESS_H

#include <optional>
#include <string>

namespace velk {

/// The text under which an address is counted: an IPv4 address as it is, an IPv6 address as its
/// network ("2001:db8:1:2::/64"), because one visitor owns a whole /64 and can change addresses
/// in it at will. Such a network's text names itself.
/// @return nothing when `text` is null or no address.
std::optional<std::string> AutoBlockKey(const char *text);

/// `text` where it is fit for a log line (1 to 64 letters, digits, '-', '_' and '.'), else
/// "unknown".
std::string AutoBlockCategory(const char *text);

}  // namespace velk

#endif
