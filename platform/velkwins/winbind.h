#ifndef VELKWINS_WINBIND_H
#define VELKWINS_WINBIND_H

#include <string>

namespace velkwins {

/// The short (NetBIOS) name of the domain `realm`, as winbind knows it; "" where it knows none,
/// or where this machine has no winbind. Thread-safe.
std::string ShortDomainName(const std::string &realm);

}  // namespace velkwins

#endif
