#ifndef OPERATIONS_VISIT_H
#define OPERATIONS_VISIT_H

#include <optional>
#include <string>

#include "operations/database.h"
#include "operations/secret.h"

/// Visits through the access API, as a web front end makes them.

namespace operations {

/// What a visitor presents.
struct Visit {
  std::string hash;
  std::string address = "127.0.0.1";    ///< As ParseAddress() gives it.
  std::optional<Secret> session_id;     ///< Of an earlier login.
  std::optional<Secret> link_password;  ///< For a link with a password.
  std::optional<std::string> account;   ///< For a link for accounts.
  std::optional<Secret> account_password;
  bool keep_block_state = false;  ///< Of a login: leave the address's failures as they are.
};

/// A result code of the access API.
struct VisitResult {
  int code;
  const char *name;     ///< "WRONG_PASSWORD": the enumerator without its prefix.
  const char *meaning;  ///< One sentence without a full stop.
};

/// What a code of a login, or of a logout, means; "UNKNOWN" for one that there is not.
VisitResult ExplainLogin(int code);
VisitResult ExplainLogout(int code);

/// What a link asks its visitors for.
enum Credential { NO_CREDENTIAL, LINK_PASSWORD, ACCOUNT };

/// @return NO_CREDENTIAL also for a link that does not exist.
Credential CredentialOf(BaseDB &db, const std::string &hash);

/// @param session_id receives the session's identifier when the visitor is let in.
VisitResult LogIn(const Visit &visit, Secret &session_id);
/// Whether the visitor is still authorised; renews session and grant.
VisitResult Check(const Visit &visit);
VisitResult LogOut(const Visit &visit);

}  // namespace operations

#endif
