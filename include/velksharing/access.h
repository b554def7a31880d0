#ifndef VELKSHARING_ACCESS_H
#define VELKSHARING_ACCESS_H

#include <stddef.h>

#include "velksharing/export.h"

/// Letting visitors in: what a web front end calls while it serves a request.
///
///     struct _tag_sharing_login_params params = {hash, password, NULL, NULL, NULL};
///     char session_id[33] = "";
///     if (VelkSharingLogin(session_id, sizeof session_id, &params, 0) == VELK_SHARING_LOGIN_OK)
///       send_cookie(session_id);           /* from now on: params.session_id = the cookie */
///     …
///     if (VelkSharingIsAuthorized(&params) == VELK_SHARING_AUTH_OK) serve();
///
/// The visitor's address is that of the platform's current CGI request (REMOTE_ADDR). All calls
/// work on the one sharing database of this process, opened at the first call; a process whose
/// first call could not open it fails every call until it ends. One thread at a time; a process
/// that forks must make its first call after the fork.

/// What a visitor presents. The caller owns the record and its zero-terminated texts; the library
/// only reads them, during the call. Texts that a call does not need may be null.
struct _tag_sharing_login_params {
  const char *hash;           ///< The link's hash. Required.
  const char *password;       ///< Link password, for a link protected by one.
  const char *username;       ///< Account name, for a link limited to accounts and groups. Null in
                              ///< VelkSharingIsAuthorized(): the account of the session counts.
  const char *user_password;  ///< That account's password.
  const char *session_id;     ///< Session identifier from an earlier login; null or unknown at
                              ///< the first.
};

/// What VelkSharingLogin() returns. "Counted" failures are reported to the automatic blocking of
/// the visitor's address.
enum VelkSharingLoginResult {
  VELK_SHARING_LOGIN_OK = 1,                ///< Logged in.
  VELK_SHARING_LOGIN_ACCOUNT_REFUSED = -2,  ///< Wrong account name or password. Counted.
  VELK_SHARING_LOGIN_REFUSED = -3,          ///< Link unknown or not valid; or, counted, no password
                                            ///< given or the account could not be checked.
  VELK_SHARING_LOGIN_UNUSABLE = -4,         ///< Database unusable, parameters missing, address
                                            ///< unknown, or session or grant not stored.
  VELK_SHARING_LOGIN_BLOCKED = -8,          ///< The visitor's address is blocked.
  VELK_SHARING_LOGIN_WRONG_PASSWORD = -9,   ///< Wrong link password. Counted.
  VELK_SHARING_LOGIN_NOT_PERMITTED = -10,   ///< The account is not among those permitted. Counted
                                            ///< unless the block state is kept.
  VELK_SHARING_LOGIN_USED_UP = -11          ///< The link's number of uses is reached.
};

/// What VelkSharingIsAuthorized() returns.
enum VelkSharingAuthResult {
  VELK_SHARING_AUTH_OK = 1,             ///< Authorised; session and grant live for another day.
  VELK_SHARING_AUTH_LAPSED = -1,        ///< Session or grant lapsed while being checked.
  VELK_SHARING_AUTH_REFUSED = -2,       ///< Another address than the session's; or the account's
                                        ///< name and password were given and are wrong.
  VELK_SHARING_AUTH_UNUSABLE = -4,      ///< Database unusable, parameters missing, address
                                        ///< unknown, account not to be checked, or not stored.
  VELK_SHARING_AUTH_NO_SESSION = -5,    ///< No live session of that identifier.
  VELK_SHARING_AUTH_LINK_INVALID = -6,  ///< The link is disabled, not started, expired or over
                                        ///< its uses; or the account is not permitted.
  VELK_SHARING_AUTH_NO_GRANT = -7       ///< No such link, or the session has no live grant on it.
};

#ifdef __cplusplus
#include <string>

extern "C" {
#endif

/// Logs a visitor in to a link: checks the credential that the link asks for, counts one use,
/// makes or renews the visitor's session and its grant on the link (86400 seconds each).
///
/// @param session_id_buf receives the session identifier's characters, at most `buf_size`, then a
///        NUL in its last byte; no NUL directly behind a shorter identifier. So pass a zero-filled
///        buffer of at least 33 bytes. Without a login only the last byte is written.
/// @param keep_block_state 1: do not report an account that is not permitted, and do not forget
///        the address's earlier failures on success; any other value: do both.
/// @return a VelkSharingLoginResult; VELK_SHARING_LOGIN_UNUSABLE, with nothing done, for a null or
///         zero-sized buffer. Throws nothing.
VELK_EXPORT int VelkSharingLogin(char *session_id_buf, size_t buf_size,
                                 const struct _tag_sharing_login_params *params,
                                 int keep_block_state);

/// Decides whether a logged-in visitor may still use a link, and pushes the end of session and
/// grant to 86400 seconds from now. Costs no use and never touches the automatic blocking.
/// @param params `hash` and `session_id` are required.
/// @return a VelkSharingAuthResult. Throws nothing.
VELK_EXPORT int VelkSharingIsAuthorized(const struct _tag_sharing_login_params *params);

/// Takes one session's grant on one link away. The session itself stays.
/// @return 1 done, 0 not: null argument, no live session, no such link, no live grant, or the
///         database failed. Throws nothing.
VELK_EXPORT int VelkSharingLogout(const char *hash, const char *session_id);

/// Counts one use of a link, without a limit. Two processes that count at the same moment may
/// count once.
/// @return 1 done, 0 not: null argument, no such link, or the database failed. Throws nothing.
VELK_EXPORT int VelkSharingIncreaseUseCount(const char *hash);

#ifdef __cplusplus
}  // extern "C"

namespace VELK {

/// As the flat form.
/// @param session_id_out receives the session identifier on success and is left alone otherwise.
VELK_EXPORT int VelkSharingLogin(std::string &session_id_out,
                                 const _tag_sharing_login_params *params, bool keep_block_state);

/// As the flat form.
VELK_EXPORT int VelkSharingIsAuthorized(const _tag_sharing_login_params *params);

/// As the flat form.
VELK_EXPORT int VelkSharingLogout(const std::string &hash, const std::string &session_id);

/// As the flat form.
VELK_EXPORT int VelkSharingIncreaseUseCount(const std::string &hash);

}  // namespace VELK
#endif

#endif
