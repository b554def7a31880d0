#ifndef OPERATIONS_SESSIONS_H
#define OPERATIONS_SESSIONS_H

#include <optional>
#include <string>
#include <vector>

#include "operations/database.h"
#include "velksharing/record.h"

/// What an administrator does with visitors' sessions and their grants on links. Sessions and
/// grants are named by their row ids, never by the session's secret identifier. Every function
/// throws Failure: NOT_FOUND for an unknown id, DATABASE when a statement failed.

namespace operations {

using VELK::sharing::record::Session;
using VELK::sharing::record::Token;

/// Which sessions; the newest first.
struct SessionQuery {
  std::optional<unsigned int> uid;     ///< Of this account only.
  std::optional<std::string> address;  ///< From this address only.
  Page page;
};

struct SessionList {
  std::vector<Session> sessions;  ///< One page of the live ones.
  int total = 0;                  ///< Live sessions that the filters admit.
  int lapsed = 0;                 ///< Lapsed ones that they admit, which are not given.
};

SessionList ListSessions(BaseDB &db, const SessionQuery &query);

/// Deletes a session: its visitor is logged out of every link.
void DeleteSession(BaseDB &db, int id);

/// Removes the lapsed sessions.
Removal PurgeSessions(BaseDB &db);

/// Which grants; the newest first.
struct GrantQuery {
  std::optional<std::string> hash;  ///< On this link only.
  std::optional<int> session_id;    ///< Of this session (row id) only.
  Page page;
};

/// A grant and the link that it is on.
struct Grant {
  Token token;
  std::string hash;  ///< "" when the link is gone.
};

struct GrantList {
  std::vector<Grant> grants;  ///< One page of the live ones.
  int total = 0;              ///< Live grants that the filters admit.
  int lapsed = 0;             ///< Lapsed ones that they admit, which are not given.
};

GrantList ListGrants(BaseDB &db, const GrantQuery &query);

/// Deletes a grant: its visitor must log in to that link again.
void DeleteGrant(BaseDB &db, int id);

/// Removes the lapsed grants.
Removal PurgeGrants(BaseDB &db);

}  // namespace operations

#endif
