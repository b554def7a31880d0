#include "site/visitor.h"

#include <velksharing/constants.h>

#include <string_view>

#include "http/cookies.h"
#include "site/session_ids.h"

namespace web {
namespace {

constexpr char kFormKeyCookie[] = "sharing_csrf";

std::string_view ClaimedSessionId(const Request &request) {
  const std::string *field = FindSessionField(request);
  const std::string_view claimed = field != nullptr && !field->empty()
                                       ? std::string_view(*field)
                                       : FindCookie(request, VELK::sharing::SZK_SHARING_SID);
  return IsSessionId(claimed) ? claimed : std::string_view();
}

std::string BroughtFormKey(const Request &request) {
  const std::string_view key = FindCookie(request, kFormKeyCookie);
  return FormTokens::IsKey(key) ? std::string(key) : "";
}

bool SaysPrefetch(std::string_view value) {
  return value.find("prefetch") != std::string_view::npos ||
         value.find("preview") != std::string_view::npos;
}

}  // namespace

const char *const kFormTokenField = "csrf";

Visitor::Visitor(const Request &request, const FormTokens &tokens, const std::string &hash,
                 const std::string &address)
    : request_(request),
      tokens_(tokens),
      hash_(hash),
      address_(address),
      session_id_(ClaimedSessionId(request)),
      brought_form_key_(BroughtFormKey(request)),
      form_key_(brought_form_key_.empty() ? FormTokens::NewKey() : brought_form_key_) {}

bool Visitor::OnlyPeeks() const {
  if (request_.method == "HEAD") return true;
  for (const char *field : {"Sec-Purpose", "Purpose", "X-Purpose", "X-Moz"})
    if (SaysPrefetch(request_.headers.Get(field))) return true;
  return false;
}

std::string Visitor::FormToken() const {
  return tokens_.Token(form_key_, hash_);
}

bool Visitor::HasRightForm(const Form &form) const {
  if (!IsFromOwnPage(request_)) return false;
  if (FindSessionField(request_) != nullptr) return true;
  const std::string *token = form.Find(kFormTokenField);
  return token != nullptr && tokens_.IsRight(*token, brought_form_key_, hash_);
}

void Visitor::KeepFormKey(Response &response) const {
  if (brought_form_key_.empty())
    AddCookie(response, kFormKeyCookie, form_key_, address_, Fate::KEPT);
}

bool Visitor::KeepSession(Response &response, const std::string &session_id) const {
  if (!IsSessionId(session_id)) return false;
  AddCookie(response, VELK::sharing::SZK_SHARING_SID, session_id, address_, Fate::KEPT);
  return true;
}

void Visitor::ForgetSession(Response &response) const {
  AddCookie(response, VELK::sharing::SZK_SHARING_SID, "", address_, Fate::WITHDRAWN);
}

void Visitor::KeepGuardSession(Response &response, const std::string &session_id,
                               const std::string &path) const {
  if (!path.empty() && IsSessionId(session_id))
    AddCookie(response, GuardCookieName(hash_), session_id, path, Fate::KEPT);
}

void Visitor::ForgetGuardSession(Response &response, const std::string &path) const {
  if (!path.empty()) AddCookie(response, GuardCookieName(hash_), "", path, Fate::WITHDRAWN);
}

void Visitor::AddCookie(Response &response, const std::string &name, const std::string &value,
                        const std::string &path, Fate fate) const {
  Cookie cookie;
  cookie.name = name;
  cookie.value = value;
  cookie.path = path;
  cookie.is_secure = request_.is_https;
  cookie.is_withdrawn = fate == Fate::WITHDRAWN;
  response.headers.Add("Set-Cookie", SetCookieText(cookie));
}

}  // namespace web
