#include "site/access.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <utility>

#include "site/result_names.h"
#include "site/transaction.h"

namespace web {
namespace {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

const char *FieldText(const Form &form, const char *name) {
  const std::string *value = form.Find(name);
  return value == nullptr ? nullptr : value->c_str();
}

}  // namespace

Checked Authorize(const std::string &hash, const std::string &session_id) {
  const _tag_sharing_login_params params = {hash.c_str(), nullptr, nullptr, nullptr,
                                            session_id.c_str()};
  Transaction transaction;
  int code = VELK::VelkSharingIsAuthorized(&params);
  Checked checked;
  Entry link;
  if (EntryDB(SharingDB::Instance()).GetByHash(hash, link)) checked.link = std::move(link);
  if (!transaction.Commit()) code = VELK_SHARING_AUTH_UNUSABLE;
  checked.result = {code, AuthResultName(code)};
  return checked;
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
