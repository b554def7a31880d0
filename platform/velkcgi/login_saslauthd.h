#ifndef VELKCGI_LOGIN_SASLAUTHD_H
#define VELKCGI_LOGIN_SASLAUTHD_H

#include <string_view>

namespace velk {

enum class SaslauthdAnswer {
  kAccepted,
  kRefused,       ///< It said no; or it did not say yes in time and in an orderly way, or we lack
                  ///< the means to ask (both logged).
  kNotReachable,  ///< Nobody listens on the socket, or we may not use it (logged).
};

/// Asks the saslauthd on VELK_SASLAUTHD_SOCKET whether the password is the account's. Its own
/// account management takes part in the answer. Waits at most 10 seconds for each step.
SaslauthdAnswer AskSaslauthd(std::string_view name, std::string_view password);

}  // namespace velk

#endif
