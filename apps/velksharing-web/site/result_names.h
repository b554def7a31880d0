#ifndef VELKSHARING_WEB_SITE_RESULT_NAMES_H
#define VELKSHARING_WEB_SITE_RESULT_NAMES_H

namespace web {

/// The name of a VelkSharingLoginResult, as its header spells it: "VELK_SHARING_LOGIN_OK".
/// @return "" for a number that has none.
const char *LoginResultName(int code);

/// The name of a VelkSharingAuthResult.
const char *AuthResultName(int code);

}  // namespace web

#endif
