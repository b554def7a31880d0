#ifndef OPERATIONS_ADDRESS_H
#define OPERATIONS_ADDRESS_H

#include <string>

namespace operations {

/// An IP address in the one spelling that the platform uses for visitors: printed by the C
/// library, an IPv4 address written as IPv6 as IPv4, a zone id dropped.
/// @throws Failure INVALID when `text` is no address.
std::string ParseAddress(const std::string &text);

}  // namespace operations

#endif
