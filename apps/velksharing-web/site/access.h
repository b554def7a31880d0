#ifndef VELKSHARING_WEB_SITE_ACCESS_H
#define VELKSHARING_WEB_SITE_ACCESS_H

#include <optional>
#include <string>

#include "http/form.h"
#include "site/answers.h"
#include "site/find_entry.h"

/// The access API for the platform's current request, with the names of its results.

namespace web {

/// A VelkSharingAuthResult with its name.
Result CheckResult(int code);

/// What came of a check, with the link as it was at that moment.
struct Checked {
  Result result;      ///< The code is a VelkSharingAuthResult.
  EntryPointer link;  ///< Null for one that cannot be read.
};

/// Checks whether a session may use a link.
///
/// The link is the one that was checked. Where none asks for an account, all of it is one
/// transaction: the database's write lock is taken and given back once. An account's groups are
/// looked up without that lock; a link that changes meanwhile makes the check fail as unusable.
Checked Authorize(const std::string &hash, const std::string &session_id);

/// What a visitor has at a link.
struct Grant {
  unsigned int uid = 0;  ///< The account's; UID_ERR for none.
  long remaining = 0;    ///< Seconds until it ends, if it is not used again before.
};

/// What came of a check, with the grant that it found and prolonged.
struct GrantChecked {
  Result result;               ///< The code is a VelkSharingAuthResult.
  std::optional<Grant> grant;  ///< Nothing unless the visitor is authorised.
};

/// As Authorize().
GrantChecked AuthorizeGrant(const std::string &hash, const std::string &session_id);

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
