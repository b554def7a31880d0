#ifndef VELKSHARINGURL_HOST_H
#define VELKSHARINGURL_HOST_H

#include <string>

namespace sharing_url {

/// A host as it stands in a URL: a name as it is, without the dot that may end it; an IPv4 address
/// as it is; an IPv6 address, given with or without brackets, in brackets and in its short
/// spelling. A name is of letters, digits, hyphens and dots, with labels of at most 63 characters
/// and 253 altogether; one with other letters is given in its ASCII form ("xn--…").
/// @throws Mistake.
std::string HostForUrl(const std::string &text);

/// The machine's fully qualified name where the name service knows one, else its host name.
/// @throws Mistake when the machine has no name.
std::string MachineName();

}  // namespace sharing_url

#endif
