#ifndef VELKCGI_LOGIN_PAM_H
#define VELKCGI_LOGIN_PAM_H

#include <optional>
#include <string>

namespace velk {

/// Checks an account through the PAM service "velk" in this process, account management included.
/// @param remote_address of the visitor; empty when unknown.
/// @return the account's name as PAM reports it; nothing when it is refused.
std::optional<std::string> LoginThroughPam(const char *name, const char *password,
                                           const std::string &remote_address);

}  // namespace velk

#endif
