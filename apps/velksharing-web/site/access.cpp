#include "site/access.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <algorithm>
#include <ctime>
#include <utility>

#include "site/result_names.h"
#include "site/transaction.h"

namespace web {
namespace {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::db::TokenDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using VELK::sharing::record::Token;

const char *FieldText(const Form &form, const char *name) {
  const std::string *value = form.Find(name);
  return value == nullptr ? nullptr : value->c_str();
}

int Check(const std::string &hash, const std::string &session_id) {
  const _tag_sharing_login_params params = {hash.c_str(), nullptr, nullptr, nullptr,
                                            session_id.c_str()};
  return VELK::VelkSharingIsAuthorized(&params);
}

Result Concluded(Transaction &transaction, int code) {
  if (!transaction.Commit()) code = VELK_SHARING_AUTH_UNUSABLE;
  return {code, AuthResultName(code)};
}

/// The grant ends with its session, and with its link.
std::optional<Grant> FindGrant(const std::string &hash, const std::string &session_id) {
  SharingDB &db = SharingDB::Instance();
  Entry link;
  Session session;
  Token token;
  if (!EntryDB(db).GetByHash(hash, link) || !SessionDB(db).GetBySessionId(session_id, session) ||
      !TokenDB(db).GetBySessionEntry(session, link, token))
    return std::nullopt;
  long end = std::min(session.get_timeout(), token.get_timeout());
  if (link.get_expire_at() > 0) end = std::min(end, link.get_expire_at());
  return Grant{session.get_uid(), std::max(end - static_cast<long>(time(nullptr)), 0L)};
}

}  // namespace

Checked Authorize(const std::string &hash, const std::string &session_id) {
  Transaction transaction;
  const int code = Check(hash, session_id);
  Checked checked;
  Entry link;
  if (EntryDB(SharingDB::Instance()).GetByHash(hash, link)) checked.link = std::move(link);
  checked.result = Concluded(transaction, code);
  return checked;
}

GrantChecked AuthorizeGrant(const std::string &hash, const std::string &session_id) {
  Transaction transaction;
  const int code = Check(hash, session_id);
  std::optional<Grant> grant;
  if (code == VELK_SHARING_AUTH_OK) grant = FindGrant(hash, session_id);
  const Result result = Concluded(transaction, code);
  if (result.code != VELK_SHARING_AUTH_OK) grant.reset();
  return {result, grant};
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
