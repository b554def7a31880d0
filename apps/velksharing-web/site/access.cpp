#include "site/access.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>

#include <algorithm>
#include <ctime>
#include <functional>
#include <map>
#include <string>
#include <utility>

#include "site/result_names.h"
#include "site/transaction.h"

namespace web {
namespace {

using VELK::sharing::UID_ERR;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

const char *FieldText(const Form &form, const char *name) {
  const std::string *value = form.Find(name);
  return value == nullptr ? nullptr : value->c_str();
}

bool AsksForAccount(const EntryPointer &link) {
  return link && link->get_protect_type() == Entry::PROTECT_USER;
}

/// Whether nothing about a link is different but how often it has been used.
bool IsUnchanged(const EntryPointer &before, const EntryPointer &after) {
  if (!before || !after || before->get_id() != after->get_id()) return false;
  std::map<std::string, std::string> was = before->GetFieldMap();
  std::map<std::string, std::string> is = after->GetFieldMap();
  was.erase(VELK::sharing::SZK_USE_COUNT);
  is.erase(VELK::sharing::SZK_USE_COUNT);
  return was == is;
}

int Check(const std::string &hash, const std::string &session_id) {
  const _tag_sharing_login_params params = {hash.c_str(), nullptr, nullptr, nullptr,
                                            session_id.c_str()};
  return VELK::VelkSharingIsAuthorized(&params);
}

/// The grant ends with its session, and with its link.
std::optional<Grant> FindGrant(const Entry &link, const std::string &session_id) {
  SharingDB &db = SharingDB::Instance();
  VELK::sharing::db::Result grants;
  VELK::sharing::db::Row grant;
  const bool is_read = db.Execute(
      "SELECT uid, min(session.timeout, token.timeout) AS timeout FROM session"
      " JOIN token ON token.session_id = session.id WHERE session.session_id = '" +
          db.Escape(session_id) + "' AND token.entry_id = " + std::to_string(link.get_id()),
      grants);
  if (!is_read || !grants.NextRow(grant)) return std::nullopt;
  long end = grant.GetField("timeout").AsTime(0);
  if (link.get_expire_at() > 0) end = std::min(end, link.get_expire_at());
  return Grant{grant.GetField("uid").AsUInt(UID_ERR),
               std::max(end - static_cast<long>(time(nullptr)), 0L)};
}

/// What is found while a check is held together with it.
using Finder = std::function<void(const Entry &link)>;

/// @param find runs for a visitor who is in, with the link as it was checked.
Checked CheckAtOnce(Transaction &transaction, EntryPointer link, const std::string &hash,
                    const std::string &session_id, const Finder &find) {
  const int code = Check(hash, session_id);
  if (code == VELK_SHARING_AUTH_OK && link) find(*link);
  if (!transaction.Commit()) return {CheckResult(VELK_SHARING_AUTH_UNUSABLE), nullptr};
  return {CheckResult(code), std::move(link)};
}

/// Looking an account's groups up may take seconds, for which no other visitor is to wait. That the
/// link has stayed the same meanwhile is looked at afterwards.
Checked CheckWithAccount(const EntryPointer &before, const std::string &hash,
                         const std::string &session_id, const Finder &find) {
  const int code = Check(hash, session_id);
  EntryPointer link = FindEntry(hash);
  if (code == VELK_SHARING_AUTH_OK && !IsUnchanged(before, link))
    return {CheckResult(VELK_SHARING_AUTH_UNUSABLE), nullptr};
  if (code == VELK_SHARING_AUTH_OK) find(*link);
  return {CheckResult(code), std::move(link)};
}

Checked CheckAndFind(const std::string &hash, const std::string &session_id, const Finder &find) {
  Transaction transaction;
  if (!transaction.IsOpen()) return {CheckResult(VELK_SHARING_AUTH_UNUSABLE), nullptr};
  EntryPointer link = FindEntry(hash);
  if (!AsksForAccount(link))
    return CheckAtOnce(transaction, std::move(link), hash, session_id, find);
  transaction.Commit();
  return CheckWithAccount(link, hash, session_id, find);
}

}  // namespace

Result CheckResult(int code) {
  return {code, AuthResultName(code)};
}

Checked Authorize(const std::string &hash, const std::string &session_id) {
  return CheckAndFind(hash, session_id, [](const Entry &) {});
}

GrantChecked AuthorizeGrant(const std::string &hash, const std::string &session_id) {
  std::optional<Grant> grant;
  const Checked checked = CheckAndFind(
      hash, session_id, [&](const Entry &link) { grant = FindGrant(link, session_id); });
  if (checked.result.code != VELK_SHARING_AUTH_OK) grant.reset();
  return {checked.result, grant};
}

Result LogIn(const std::string &hash, const Form &form, bool keep_block_state,
             std::string &session_id) {
  const _tag_sharing_login_params params = {
      hash.c_str(), FieldText(form, VELK::sharing::SZK_PASSWORD_),
      FieldText(form, VELK::sharing::SZK_ZED_USERNAME),
      FieldText(form, VELK::sharing::SZK_ZED_PASSWORD), nullptr};
  const int code = VELK::VelkSharingLogin(session_id, &params, keep_block_state);
  return {code, LoginResultName(code)};
}

Result LogOut(const std::string &hash, const std::string &session_id) {
  const int code = VELK::VelkSharingLogout(hash, session_id);
  return {code, code == 1 ? "OK" : "FAILED"};
}

}  // namespace web
