#include "operations/visit.h"

#include <cstddef>

#include "operations/links.h"
#include "velk/velkcgi.h"
#include "velksharing/access.h"

namespace operations {
namespace {

constexpr VisitResult kLoginResults[] = {
    {VELK_SHARING_LOGIN_OK, "OK", "logged in"},
    {VELK_SHARING_LOGIN_ACCOUNT_REFUSED, "ACCOUNT_REFUSED", "wrong account name or password"},
    {VELK_SHARING_LOGIN_REFUSED, "REFUSED",
     "the link is unknown or not valid, or nothing was presented that could be checked"},
    {VELK_SHARING_LOGIN_UNUSABLE, "UNUSABLE", "the login could not be made or stored"},
    {VELK_SHARING_LOGIN_BLOCKED, "BLOCKED", "the visitor's address is blocked"},
    {VELK_SHARING_LOGIN_WRONG_PASSWORD, "WRONG_PASSWORD", "wrong link password"},
    {VELK_SHARING_LOGIN_NOT_PERMITTED, "NOT_PERMITTED", "the account is not among those permitted"},
    {VELK_SHARING_LOGIN_USED_UP, "USED_UP", "the link's number of uses is reached"},
};

constexpr VisitResult kCheckResults[] = {
    {VELK_SHARING_AUTH_OK, "OK", "authorised for another day"},
    {VELK_SHARING_AUTH_LAPSED, "LAPSED", "session or grant lapsed while being checked"},
    {VELK_SHARING_AUTH_REFUSED, "REFUSED",
     "the address is not the session's, or the account's password is wrong"},
    {VELK_SHARING_AUTH_UNUSABLE, "UNUSABLE", "the check could not be made or stored"},
    {VELK_SHARING_AUTH_NO_SESSION, "NO_SESSION", "there is no live session of that identifier"},
    {VELK_SHARING_AUTH_LINK_INVALID, "LINK_INVALID",
     "the link is not valid now, or the account is not permitted"},
    {VELK_SHARING_AUTH_NO_GRANT, "NO_GRANT",
     "there is no such link, or the session has no live grant on it"},
};

constexpr VisitResult kLogoutResults[] = {
    {1, "OK", "logged out"},
    {0, "FAILED", "there was no live session with a live grant on this link"},
};

template <std::size_t count>
VisitResult Explain(const VisitResult (&results)[count], int code) {
  for (const VisitResult &result : results)
    if (result.code == code) return result;
  return {code, "UNKNOWN", "the library gave a code that has no name"};
}

const char *Text(const std::optional<Secret> &secret) {
  return secret ? secret->c_str() : nullptr;
}

_tag_sharing_login_params Parameters(const Visit &visit) {
  return {visit.hash.c_str(), Text(visit.link_password),
          visit.account ? visit.account->c_str() : nullptr, Text(visit.account_password),
          Text(visit.session_id)};
}

/// The web request that a visit comes with: an address and nothing else, whatever stands in the
/// environment of this process.
class Request {
 public:
  explicit Request(const std::string &address) : remote_("REMOTE_ADDR=" + address) {
    environment_[0] = "REQUEST_METHOD=GET";
    environment_[1] = remote_.c_str();
    VelkCgiRequestBegin(&request_);
  }
  Request(const Request &) = delete;
  Request &operator=(const Request &) = delete;
  ~Request() { VelkCgiRequestEnd(); }

 private:
  const std::string remote_;
  const char *environment_[3] = {};
  const VelkCgiRequest request_ = {environment_, nullptr, 0};
};

}  // namespace

VisitResult ExplainLogin(int code) {
  return Explain(kLoginResults, code);
}

VisitResult ExplainLogout(int code) {
  return Explain(kLogoutResults, code);
}

Credential CredentialOf(BaseDB &db, const std::string &hash) {
  try {
    const Entry::ProtectType type = FindLink(db, hash).get_protect_type();
    if (type == Entry::PROTECT_PASSWORD) return LINK_PASSWORD;
    return type == Entry::PROTECT_USER ? ACCOUNT : NO_CREDENTIAL;
  } catch (const Failure &failure) {
    if (failure.kind() == Failure::DATABASE) throw;
    return NO_CREDENTIAL;
  }
}

VisitResult LogIn(const Visit &visit, Secret &session_id) {
  const Request request(visit.address);
  const _tag_sharing_login_params parameters = Parameters(visit);
  std::string buffer(64, '\0');
  const int code =
      VelkSharingLogin(buffer.data(), buffer.size(), &parameters, visit.keep_block_state ? 1 : 0);
  for (const char *byte = buffer.c_str(); *byte != '\0'; ++byte) session_id.Append(*byte);
  Wipe(buffer);
  return ExplainLogin(code);
}

VisitResult Check(const Visit &visit) {
  const Request request(visit.address);
  const _tag_sharing_login_params parameters = Parameters(visit);
  return Explain(kCheckResults, VelkSharingIsAuthorized(&parameters));
}

VisitResult LogOut(const Visit &visit) {
  const Request request(visit.address);
  return ExplainLogout(VelkSharingLogout(visit.hash.c_str(), Text(visit.session_id)));
}

}  // namespace operations
