#include <array>
#include <ctime>
#include <set>

#include "internal/log.h"
#include "internal/platform_ptr.h"
#include "internal/secret_text.h"
#include "record/entry_private.h"
#include "velksharing/access.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"
#include "velksharing/utils.h"

namespace VELK {
namespace {

using sharing::UID_ERR;
using sharing::db::EntryDB;
using sharing::db::SessionDB;
using sharing::db::SharingDB;
using sharing::db::TokenDB;
using sharing::internal::CgiPtr;
using sharing::internal::LogErrorWithoutPid;
using sharing::internal::Origin;
using sharing::internal::SecretText;
using sharing::internal::UserPtr;
using sharing::record::Entry;
using sharing::record::EntryPrivate;
using sharing::record::Session;
using sharing::record::Token;

constexpr char kSource[] = "sharinglogin";
constexpr char kBlockCategory[] = "SHARING";
constexpr long kLifetimeSeconds = 86400;
constexpr int kDone = 1;
constexpr int kNotDone = 0;

/// What the check of an account has come to. The values are those of VelkSharingAuthResult.
enum AccountCheck {
  kAccepted = VELK_SHARING_AUTH_OK,
  kWrongCredentials = VELK_SHARING_AUTH_REFUSED,
  kNotCheckable = VELK_SHARING_AUTH_UNUSABLE,
  kNotPermitted = VELK_SHARING_AUTH_LINK_INVALID
};

long EndOfLifetime() {
  return static_cast<long>(time(nullptr)) + kLifetimeSeconds;
}

bool GetRemoteIP(std::string &ip_out) {
  std::array<char, 65> buffer{};
  if (VelkCgiGetRemoteIP(buffer.data(), buffer.size()) == -1) return false;
  ip_out = buffer.data();
  return true;
}

/// Hands the platform's own login session, a parameter of the request, to the platform's login.
bool TakeOverPlatformSession(VelkCgi *cgi) {
  const char *platform_session = VelkCgiGetRequestParam(cgi, "_sid", nullptr);
  if (platform_session == nullptr || *platform_session == '\0') return true;
  return VelkCgiSetCookies(cgi, "id", platform_session, 0, "/", nullptr, 0) == 1;
}

bool PlatformLogin(VelkCgi *cgi, const _tag_sharing_login_params *params) {
  const std::string name = sharing::GetRealUsername(params->username);
  VelkCgiLoginRecord record = {name.c_str(), params->user_password, "webui", 15, 1};
  std::array<char, 101> reported_name{};
  return VelkCgiLogin(cgi, reported_name.data(), reported_name.size(), &record) == 1;
}

/// Finds the account to check: the one that logs in now or, without a name, the one remembered.
/// @param uid the remembered account; receives the one that logged in.
AccountCheck FindAccount(VelkCgi *cgi, const _tag_sharing_login_params *params, unsigned int &uid,
                         UserPtr &user, std::set<unsigned int> &gids) {
  VELKUSER *found = nullptr;
  if (params->username == nullptr) {
    const int answer = VELKUserGetByUID(uid, &found);
    user.reset(found);
    return answer == 0 && sharing::UserGroupsGet(user.get(), gids) ? kAccepted : kNotCheckable;
  }
  if (!PlatformLogin(cgi, params)) return kWrongCredentials;
  const bool known = sharing::UserGet(params->username, found);
  user.reset(found);
  if (!known || !sharing::UserGroupsGet(user.get(), gids)) return kNotCheckable;
  uid = user->uid;
  return kAccepted;
}

/// Whether the link permits the account by its stored ids. Names that had no id when they were set
/// do not count, even if they have one now.
bool IsPermitted(const EntryPrivate &entry, unsigned int uid, const std::set<unsigned int> &gids) {
  for (unsigned int permitted : entry.protect_uids_) {
    if (permitted == uid) return true;
  }
  for (unsigned int permitted : entry.protect_gids_) {
    if (gids.count(permitted) != 0) return true;
  }
  return false;
}

AccountCheck LoginProtectUser(const Entry &entry, const _tag_sharing_login_params *params,
                              unsigned int &uid_io) {
  VelkCgi *context = nullptr;
  const bool has_context = VelkCgiInit(&context, "") == 1;
  UserPtr user;
  const CgiPtr cgi(context);
  if (!has_context) return kNotCheckable;
  VelkCgiLoadInCookies(cgi.get());
  if (!TakeOverPlatformSession(cgi.get())) return kNotCheckable;

  std::set<unsigned int> gids;
  const AccountCheck found = FindAccount(cgi.get(), params, uid_io, user, gids);
  if (found != kAccepted) return found;
  const auto &stored = static_cast<const EntryPrivate &>(entry.GetCObject());
  return IsPermitted(stored, user->uid, gids) ? kAccepted : kNotPermitted;
}

int RefuseAndCount(const std::string &ip, VelkSharingLoginResult result) {
  AutoBlockFailLoginSet(ip.c_str(), kBlockCategory);
  return result;
}

int CheckPassword(const Entry &entry, const _tag_sharing_login_params *params,
                  const std::string &ip) {
  if (params->password == nullptr) return RefuseAndCount(ip, VELK_SHARING_LOGIN_REFUSED);
  const SecretText password{params->password};
  if (entry.IsPasswordValid(password.text())) return VELK_SHARING_LOGIN_OK;
  return RefuseAndCount(ip, VELK_SHARING_LOGIN_WRONG_PASSWORD);
}

int CheckAccount(const Entry &entry, const _tag_sharing_login_params *params, bool keep_block_state,
                 const std::string &ip, unsigned int &uid) {
  switch (LoginProtectUser(entry, params, uid)) {
    case kAccepted:
      return VELK_SHARING_LOGIN_OK;
    case kNotPermitted:
      if (keep_block_state) return VELK_SHARING_LOGIN_NOT_PERMITTED;
      return RefuseAndCount(ip, VELK_SHARING_LOGIN_NOT_PERMITTED);
    case kWrongCredentials:
      return RefuseAndCount(ip, VELK_SHARING_LOGIN_ACCOUNT_REFUSED);
    default:
      return RefuseAndCount(ip, VELK_SHARING_LOGIN_REFUSED);
  }
}

/// Checks what the link asks for.
/// @param uid receives the account's, when the link asks for one.
int CheckCredential(const Entry &entry, const _tag_sharing_login_params *params,
                    bool keep_block_state, const std::string &ip, unsigned int &uid) {
  switch (entry.get_protect_type()) {
    case Entry::PROTECT_PASSWORD:
      return CheckPassword(entry, params, ip);
    case Entry::PROTECT_USER:
      return CheckAccount(entry, params, keep_block_state, ip, uid);
    default:
      return VELK_SHARING_LOGIN_OK;
  }
}

bool IsUsedUp(const Entry &entry) {
  return entry.get_expire_times() > 0 && entry.get_use_count() >= entry.get_expire_times();
}

/// Finds the visitor's live session or makes a new one; gives it the visitor's address and a new
/// lifetime. A found one is written later, with its account.
bool RenewSession(SessionDB &sessions, const char *session_id, const std::string &ip,
                  Session &session) {
  const bool found = session_id != nullptr && sessions.GetBySessionId(session_id, session);
  session.set_ip(ip);
  session.set_timeout(EndOfLifetime());
  return found || sessions.CreateWithSessionId(session);
}

bool RenewToken(TokenDB &tokens, const Session &session, const Entry &entry, Token &token) {
  const bool found = tokens.GetBySessionEntry(session, entry, token);
  token.set_timeout(EndOfLifetime());
  if (found) return tokens.Update(token);
  token.set_session_id(session.get_id());
  token.set_entry_id(entry.get_id());
  return tokens.Create(token);
}

/// Gives a visitor whose credential holds a session and a grant on the link.
bool LetIn(TokenDB &tokens, const Entry &entry, const _tag_sharing_login_params *params,
           unsigned int uid, Session &session, Token &token) {
  SharingDB &database = SharingDB::Instance();
  SessionDB sessions(database);
  std::string ip;
  if (!database.IsGood() || !GetRemoteIP(ip)) return false;
  if (!RenewSession(sessions, params->session_id, ip, session)) return false;
  if (!RenewToken(tokens, session, entry, token)) return false;
  if (entry.get_protect_type() == Entry::PROTECT_USER) session.set_uid(uid);
  return sessions.Update(session);
}

/// Logs why a call ends here, and ends it.
int LogAndReturn(Origin origin, const char *format, int result) {
  LogErrorWithoutPid(origin, format);
  return result;
}

/// What the database holds of a logged-in visitor.
struct Visit {
  Session session;
  Token token;
  Entry entry;
};

int FindVisit(SharingDB &database, const _tag_sharing_login_params *params, Visit &visit) {
  if (!SessionDB(database).GetBySessionId(params->session_id, visit.session)) {
    return VELK_SHARING_AUTH_NO_SESSION;
  }
  if (!EntryDB(database).GetByHash(params->hash, visit.entry) ||
      !TokenDB(database).GetBySessionEntry(visit.session, visit.entry, visit.token)) {
    return VELK_SHARING_AUTH_NO_GRANT;
  }
  return VELK_SHARING_AUTH_OK;
}

/// Session and grant were live when they were found; their time may have passed since.
int CheckStillLive(SharingDB &database, const Visit &visit) {
  if (!visit.entry.IsValid()) {
    return LogAndReturn(kSource, "%s:%d entry is not valid", VELK_SHARING_AUTH_LINK_INVALID);
  }
  if (!visit.session.IsLegal()) {
    return LogAndReturn(kSource, "%s:%d session is not valid", VELK_SHARING_AUTH_LAPSED);
  }
  if (visit.token.IsLegal()) return VELK_SHARING_AUTH_OK;
  LogErrorWithoutPid(kSource, "%s:%d token is not valid");
  if (TokenDB(database).Delete(visit.token)) return VELK_SHARING_AUTH_LAPSED;
  return LogAndReturn(kSource, "%s:%d delete token failed", VELK_SHARING_AUTH_UNUSABLE);
}

/// Whether the one who asks is the one who logged in.
int CheckSameVisitor(const Visit &visit, const _tag_sharing_login_params *params,
                     const std::string &ip) {
  if (visit.entry.get_protect_type() == Entry::PROTECT_USER) {
    unsigned int uid = visit.session.get_uid();
    const int checked = LoginProtectUser(visit.entry, params, uid);
    if (checked != kAccepted) return LogAndReturn(kSource, "%s:%d user login error", checked);
  }
  if (visit.entry.get_enable_match_ip() && ip != visit.session.get_ip()) {
    LogErrorWithoutPid(kSource, "%s:%d ip not match, %s, %s", ip.c_str(),
                       visit.session.get_ip().c_str());
    return VELK_SHARING_AUTH_REFUSED;
  }
  return VELK_SHARING_AUTH_OK;
}

int RenewVisit(SharingDB &database, Visit &visit) {
  visit.session.set_timeout(EndOfLifetime());
  if (!SessionDB(database).Update(visit.session)) {
    return LogAndReturn(kSource, "%s:%d update session failed", VELK_SHARING_AUTH_UNUSABLE);
  }
  visit.token.set_timeout(EndOfLifetime());
  if (!TokenDB(database).Update(visit.token)) {
    return LogAndReturn(kSource, "%s:%d update token failed", VELK_SHARING_AUTH_UNUSABLE);
  }
  return VELK_SHARING_AUTH_OK;
}

}  // namespace

int VelkSharingLogin(std::string &session_id_out, const _tag_sharing_login_params *params,
                     bool keep_block_state) {
  SharingDB &database = SharingDB::Instance();
  const EntryDB entries(database);
  std::string ip;
  if (!database.IsGood() || params == nullptr || params->hash == nullptr || !GetRemoteIP(ip)) {
    return VELK_SHARING_LOGIN_UNUSABLE;
  }
  if (VelkCgiIsDeniedIP(ip.c_str()) == 1) {
    LogErrorWithoutPid(kSource, "%s:%d VelkAutoBlockIsDeniedIP %s", ip.c_str());
    return VELK_SHARING_LOGIN_BLOCKED;
  }

  Entry entry;
  if (!entries.GetByHash(params->hash, entry) || !entry.IsValid()) {
    return VELK_SHARING_LOGIN_REFUSED;
  }
  // One stricter than IsValid(): this login would be the use too many, while visitors who are in
  // may stay.
  if (IsUsedUp(entry)) return VELK_SHARING_LOGIN_USED_UP;

  unsigned int uid = UID_ERR;
  const int checked = CheckCredential(entry, params, keep_block_state, ip, uid);
  if (checked != VELK_SHARING_LOGIN_OK) return checked;
  if (VelkSharingIncreaseUseCount(params->hash) != kDone) {
    LogErrorWithoutPid(kSource, "%s:%d update entry use count fail");
  }

  TokenDB tokens(database);
  Session session;
  Token token;
  if (!LetIn(tokens, entry, params, uid, session, token)) {
    tokens.Delete(token);
    return VELK_SHARING_LOGIN_UNUSABLE;
  }
  session_id_out = session.get_session_id();
  if (!keep_block_state) VELKAutoBlockResetByIP(ip.c_str());
  return VELK_SHARING_LOGIN_OK;
}

int VelkSharingIsAuthorized(const _tag_sharing_login_params *params) {
  SharingDB &database = SharingDB::Instance();
  std::string ip;
  if (!database.IsGood()) {
    return LogAndReturn(kSource, "%s:%d db is not good", VELK_SHARING_AUTH_UNUSABLE);
  }
  if (params == nullptr || params->session_id == nullptr || params->hash == nullptr) {
    return VELK_SHARING_AUTH_UNUSABLE;
  }
  if (!GetRemoteIP(ip)) {
    return LogAndReturn(kSource, "%s:%d invalid ip", VELK_SHARING_AUTH_UNUSABLE);
  }

  Visit visit;
  int result = FindVisit(database, params, visit);
  if (result == VELK_SHARING_AUTH_OK) result = CheckStillLive(database, visit);
  if (result == VELK_SHARING_AUTH_OK) result = CheckSameVisitor(visit, params, ip);
  if (result == VELK_SHARING_AUTH_OK) result = RenewVisit(database, visit);
  return result;
}

int VelkSharingLogout(const std::string &hash, const std::string &session_id) {
  SharingDB &database = SharingDB::Instance();
  const EntryDB entries(database);
  const SessionDB sessions(database);
  TokenDB tokens(database);
  Entry entry;
  Session session;
  Token token;

  if (!database.IsGood()) return kNotDone;
  if (!sessions.GetBySessionId(session_id, session)) {
    return LogAndReturn(kSource, "%s:%d get session failed", kNotDone);
  }
  if (!entries.GetByHash(hash, entry)) {
    return LogAndReturn(kSource, "%s:%d get entry failed", kNotDone);
  }
  if (!tokens.GetBySessionEntry(session, entry, token)) {
    return LogAndReturn(kSource, "%s:%d get token failed", kNotDone);
  }
  return tokens.Delete(token) ? kDone : kNotDone;
}

int VelkSharingIncreaseUseCount(const std::string &hash) {
  SharingDB &database = SharingDB::Instance();
  EntryDB entries(database);
  Entry entry;
  if (!database.IsGood() || !entries.GetByHash(hash, entry)) return kNotDone;
  entry.inc_use_count();
  return entries.Update(entry) ? kDone : kNotDone;
}

}  // namespace VELK
