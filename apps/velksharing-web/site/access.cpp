#include "site/access.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>

#include "site/result_names.h"

namespace web {
namespace {

const char *FieldText(const Form &form, const char *name) {
  const std::string *value = form.Find(name);
  return value == nullptr ? nullptr : value->c_str();
}

}  // namespace

Result Authorize(const std::string &hash, const std::string &session_id) {
  const _tag_sharing_login_params params = {hash.c_str(), nullptr, nullptr, nullptr,
                                            session_id.c_str()};
  const int code = VELK::VelkSharingIsAuthorized(&params);
  return {code, AuthResultName(code)};
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
