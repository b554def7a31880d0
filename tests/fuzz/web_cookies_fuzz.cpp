// Any bytes as the fields Cookie of a request, and as parts of a cookie for the browser: what is
// found was sent, and what a browser is given is one cookie, and comes back as it was.

#include <cstdint>
#include <string>
#include <string_view>

#include "http/cookies.h"
#include "http/text.h"
#include "require.h"

namespace {

using velk_test::Require;
using web::Cookie;
using web::Request;

constexpr std::string_view kName = "sharing_sid";

std::string_view TakeLine(std::string_view &text) {
  return web::TakePart(text, '\n');
}

/// What is found stands behind the name and "=" in one of the fields, and holds no separator.
void CheckSearch(std::string_view text) {
  Request request;
  while (!text.empty()) request.headers.Add("Cookie", std::string(TakeLine(text)));
  const std::string_view value = web::FindCookie(request, kName);
  if (value.empty()) return;
  Require(value.find(';') == std::string_view::npos);
  bool is_sent = false;
  for (const auto &[name, field] : request.headers) {
    const size_t at = field.find(kName);
    is_sent = is_sent || (at != std::string::npos && field.find(value, at) != std::string::npos);
  }
  Require(is_sent);
}

/// The attributes are ours alone: one line of one cookie, whatever its parts are.
void CheckOneCookie(const Cookie &cookie, const std::string &text) {
  const std::string begin = cookie.name + "=" + (cookie.is_withdrawn ? "" : cookie.value);
  std::string_view rest = text;
  Require(web::TakePart(rest, ';') == begin);
  Require(web::TakePart(rest, ';') == " Path=" + cookie.path);
  Require(web::TakePart(rest, ';') == " HttpOnly");
  Require(web::TakePart(rest, ';') == " SameSite=Lax");
  if (cookie.is_secure) Require(web::TakePart(rest, ';') == " Secure");
  if (cookie.is_withdrawn) Require(web::TakePart(rest, ';') == " Max-Age=0");
  Require(rest.empty());
  for (const char byte : text) Require(byte >= ' ' && byte < 0x7f);
}

void CheckReturn(const Cookie &cookie) {
  Request request;
  request.headers.Add("cookie", "other=1; " + cookie.name + "=" + cookie.value + "; more=2");
  if (cookie.name == "other") return;
  Require(web::FindCookie(request, cookie.name) == cookie.value);
}

void CheckMaking(std::string_view text) {
  Cookie cookie;
  if (!text.empty()) {
    cookie.is_secure = (text.front() & 1) != 0;
    cookie.is_withdrawn = (text.front() & 2) != 0;
    text.remove_prefix(1);
  }
  cookie.name = TakeLine(text);
  cookie.value = TakeLine(text);
  cookie.path = text;
  const std::string made = web::SetCookieText(cookie);
  if (made.empty()) return;
  CheckOneCookie(cookie, made);
  CheckReturn(cookie);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string_view text(reinterpret_cast<const char *>(data), size);
  CheckSearch(text);
  CheckMaking(text);
  return 0;
}
