#ifndef OPERATIONS_ADDRESS_H
#define OPERATIONS_ADDRESS_H

#include <string>

namespace operations {

/// An IP address in the one spelling that the platform uses for visitors: printed by the C
/// library, an IPv4 address written as IPv6 as IPv4, a zone id dropped.
/// @throws Failure INVALID when `text` is no address.
std::string ParseAddress(const std::string &text);

/// What blocking remembers an address by, as the list of blocked addresses prints it: an IPv4
/// address, or the /64 network of an IPv6 address. Takes such a network, too.
/// @throws Failure INVALID when `text` is neither.
std::string ParseBlockAddress(const std::string &text);

}  // namespace operations

#endif
