#ifndef VELKSHARING_WEB_SITE_ACCESS_H
#define VELKSHARING_WEB_SITE_ACCESS_H

#include <string>

#include "http/form.h"
#include "site/answers.h"

/// The access API for the platform's current request, with the names of its results.

namespace web {

/// Whether a session may use a link. The code is a VelkSharingAuthResult.
Result Authorize(const std::string &hash, const std::string &session_id);

/// Logs a visitor in by what a form says. Makes a new session always: one that the browser brought
/// may have been put there by somebody else.
/// @param keep_block_state whether the address's earlier failures stay. They must where a login
///        proves nothing, or a guesser would wipe his failures off with an open link.
/// @param session_id receives the session's identifier on success.
/// @return the code is a VelkSharingLoginResult.
Result LogIn(const std::string &hash, const Form &form, bool keep_block_state,
             std::string &session_id);

/// Takes a session's grant on a link away. The code is 1 or 0.
Result LogOut(const std::string &hash, const std::string &session_id);

}  // namespace web

#endif
