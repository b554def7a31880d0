#include "operations/verdict.h"

#include <optional>

#include "operations/accounts.h"
#include "operations/links.h"
#include "operations/moment.h"
#include "operations/permissions.h"
#include "operations/sessions.h"
#include "velk/velksdk.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"

namespace operations {
namespace {

using VELK::sharing::db::SessionDB;
using VELK::sharing::db::TokenDB;

/// Nothing: this check has no objection.
using Objection = std::optional<Verdict>;

Verdict Refused(const std::string &reason, const std::string &sentence) {
  return {false, reason, "Refused: " + sentence + "."};
}

Verdict LetIn(const std::string &sentence) {
  return {true, "ok", sentence + "."};
}

Objection LoadLink(BaseDB &db, const std::string &hash, Entry &link) {
  try {
    link = FindLink(db, hash);
    return std::nullopt;
  } catch (const Failure &failure) {
    if (failure.kind() == Failure::NOT_FOUND) return Refused("unknown-link", failure.what());
    if (failure.kind() == Failure::REFUSED) return Refused("damaged-link", failure.what());
    throw;
  }
}

Objection CheckBlocked(const std::string &address) {
  if (address.empty() || VELKAutoBlockIsDenied(address.c_str()) != 1) return std::nullopt;
  return Refused("address-blocked", "address " + address + " is blocked");
}

Objection CheckTimes(const Entry &link) {
  const long now = Now();
  if (!link.get_enabled()) return Refused("disabled", "the link is disabled");
  if (link.get_start_at() > now) {
    return Refused("not-started",
                   "the link has not started; it does at " + MomentText(link.get_start_at()));
  }
  if (link.get_expire_at() > 0 && now > link.get_expire_at())
    return Refused("expired", "the link expired at " + MomentText(link.get_expire_at()));
  return std::nullopt;
}

Verdict UsedUp(const Entry &link) {
  return Refused("used-up", "the link is used up: " + std::to_string(link.get_use_count()) +
                                " of " + std::to_string(link.get_expire_times()) + " uses");
}

/// A login would be one use more.
Objection CheckUsesForLogin(const Entry &link) {
  if (link.get_expire_times() <= 0 || link.get_use_count() < link.get_expire_times())
    return std::nullopt;
  return UsedUp(link);
}

/// Who is logged in already stays in with the last use.
Objection CheckUsesForSession(const Entry &link) {
  if (link.get_expire_times() <= 0 || link.get_use_count() <= link.get_expire_times())
    return std::nullopt;
  return UsedUp(link);
}

Verdict WhatLoginAsksFor(const Entry &link) {
  if (link.get_protect_type() == Entry::PROTECT_PASSWORD)
    return LetIn("Let in with the link's password");
  if (link.get_protect_type() != Entry::PROTECT_USER)
    return LetIn("Let in: the link is open to everybody");
  const Permissions permissions = StoredPermissions(link);
  if (permissions.uids.empty() && permissions.gids.empty()) {
    return Refused(
        "nobody-permitted",
        "this machine knew none of the permitted accounts and groups when they were set");
  }
  return LetIn("Let in with the name and password of a permitted account");
}

Objection LoadSession(BaseDB &db, const Secret &session_id, Session &session) {
  std::string text = session_id.c_str();
  const bool live = SessionDB(db).GetBySessionId(text, session);
  Wipe(text);
  if (live) return std::nullopt;
  if (session.get_id() == 0) return Refused("unknown-session", "there is no such session");
  return Refused("lapsed-session", "the session lapsed at " + MomentText(session.get_timeout()));
}

Objection CheckGrant(BaseDB &db, const Session &session, const Entry &link) {
  Token token;
  if (TokenDB(db).GetBySessionEntry(session, link, token)) return std::nullopt;
  if (token.get_id() == 0)
    return Refused("no-grant", "the session has not logged in to this link, or logged out");
  return Refused("lapsed-grant",
                 "the session's grant on this link lapsed at " + MomentText(token.get_timeout()));
}

Objection CheckAccount(const Session &session, const Entry &link) {
  if (link.get_protect_type() != Entry::PROTECT_USER) return std::nullopt;
  if (session.get_uid() == VELK::sharing::UID_ERR)
    return Refused("no-account", "the link asks for an account and the session has none");
  const std::string account = AccountText(session.get_uid());
  switch (PermissionOf(StoredPermissions(link), session.get_uid())) {
    case PERMITTED:
      return std::nullopt;
    case NOT_PERMITTED:
      return Refused("not-permitted", "account " + account + " is not permitted");
    case NO_SUCH_ACCOUNT:
      return Refused("account-gone", "the session's account " + account + " does not exist");
  }
  return std::nullopt;
}

Objection CheckSameAddress(const Session &session, const Entry &link, const std::string &address) {
  if (!link.get_enable_match_ip() || address.empty() || address == session.get_ip())
    return std::nullopt;
  return Refused("other-address", "the session belongs to address " + session.get_ip() +
                                      ", and the link holds visitors to theirs");
}

}  // namespace

Verdict JudgeLogin(BaseDB &db, const std::string &hash, const std::string &address) {
  if (const Objection blocked = CheckBlocked(address)) return *blocked;
  Entry link;
  if (const Objection missing = LoadLink(db, hash, link)) return *missing;
  if (const Objection outside = CheckTimes(link)) return *outside;
  if (const Objection used_up = CheckUsesForLogin(link)) return *used_up;
  return WhatLoginAsksFor(link);
}

Verdict JudgeSession(BaseDB &db, const std::string &hash, const Secret &session_id,
                     const std::string &address) {
  Session session;
  if (const Objection unknown = LoadSession(db, session_id, session)) return *unknown;
  Entry link;
  if (const Objection missing = LoadLink(db, hash, link)) return *missing;
  if (const Objection ungranted = CheckGrant(db, session, link)) return *ungranted;
  if (const Objection outside = CheckTimes(link)) return *outside;
  if (const Objection used_up = CheckUsesForSession(link)) return *used_up;
  if (const Objection stranger = CheckAccount(session, link)) return *stranger;
  if (const Objection elsewhere = CheckSameAddress(session, link, address)) return *elsewhere;
  return LetIn("Let in: the session is logged in to this link");
}

}  // namespace operations
