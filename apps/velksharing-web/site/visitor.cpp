#include "site/visitor.h"

#include <velksharing/constants.h>

#include <algorithm>
#include <string_view>

#include "http/cookies.h"
#include "http/text.h"
#include "site/cgi_environment.h"

namespace web {
namespace {

constexpr char kFormKeyCookie[] = "sharing_csrf";
constexpr size_t kLongestSessionId = 128;

/// The field in which API clients send a session's identifier; null when there is none.
const std::string *FindSessionField(const Request &request) {
  for (const auto &[name, value] : request.headers)
    if (CgiName(name) == SZ_X_SHARING_HEADER) return &value;
  return nullptr;
}

bool IsSessionIdByte(char byte) {
  return IsLetterOrDigit(byte) || byte == '-' || byte == '_';
}

bool IsSessionId(std::string_view text) {
  return !text.empty() && text.size() <= kLongestSessionId &&
         std::ranges::all_of(text, IsSessionIdByte);
}

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
  if (brought_form_key_.empty()) AddCookie(response, kFormKeyCookie, form_key_, false);
}

bool Visitor::KeepSession(Response &response, const std::string &session_id) const {
  if (!IsSessionId(session_id)) return false;
  AddCookie(response, VELK::sharing::SZK_SHARING_SID, session_id, false);
  return true;
}

void Visitor::ForgetSession(Response &response) const {
  AddCookie(response, VELK::sharing::SZK_SHARING_SID, "", true);
}

void Visitor::AddCookie(Response &response, const char *name, const std::string &value,
                        bool is_withdrawn) const {
  Cookie cookie;
  cookie.name = name;
  cookie.value = value;
  cookie.path = address_;
  cookie.is_secure = request_.is_https;
  cookie.is_withdrawn = is_withdrawn;
  response.headers.Add("Set-Cookie", SetCookieText(cookie));
}

}  // namespace web
