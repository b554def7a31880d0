#ifndef VELKCGI_LOGIN_SASLAUTHD_H
#define VELKCGI_LOGIN_SASLAUTHD_H

#include <string_view>

namespace velk {

enum class SaslauthdAnswer {
  kAccepted,
  kRefused,       ///< It said no, or did not say yes in an orderly way (logged).
  kNotReachable,  ///< Nobody answers on the socket.
};

/// Asks the saslauthd on VELK_SASLAUTHD_SOCKET whether the password is the account's. Its own
/// account management takes part in the answer. Waits at most 10 seconds for each step.
SaslauthdAnswer AskSaslauthd(std::string_view name, std::string_view password);

}  // namespace velk

#endif
