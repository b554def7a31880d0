#include "http/cookies.h"

#include <strings.h>

#include <algorithm>

namespace web {
namespace {

bool IsNamed(const Fields::Field &field, const char *name) {
  return strcasecmp(field.first.c_str(), name) == 0;
}

std::string_view Trimmed(std::string_view text) {
  const size_t begin = text.find_first_not_of(" \t");
  if (begin == std::string_view::npos) return {};
  return text.substr(begin, text.find_last_not_of(" \t") - begin + 1);
}

std::string_view Unquoted(std::string_view value) {
  if (value.size() >= 2 && value.front() == '"' && value.back() == '"')
    return value.substr(1, value.size() - 2);
  return value;
}

/// Looks for a cookie in one header field.
/// @return whether it is there.
bool FindIn(std::string_view header, std::string_view name, std::string_view &value) {
  while (!header.empty()) {
    const size_t end = std::min(header.find(';'), header.size());
    const std::string_view pair = header.substr(0, end);
    header.remove_prefix(std::min(end + 1, header.size()));
    const size_t equals = pair.find('=');
    if (equals == std::string_view::npos || Trimmed(pair.substr(0, equals)) != name) continue;
    value = Unquoted(Trimmed(pair.substr(equals + 1)));
    return true;
  }
  return false;
}

bool IsCookieByte(char byte) {
  return byte > ' ' && byte < 0x7f && byte != '"' && byte != ',' && byte != ';' && byte != '\\';
}

bool IsCookieText(std::string_view text) {
  return std::all_of(text.begin(), text.end(), IsCookieByte);
}

}  // namespace

std::string_view FindCookie(const Request &request, std::string_view name) {
  std::string_view value;
  for (const Fields::Field &field : request.headers)
    if (IsNamed(field, "Cookie") && FindIn(field.second, name, value)) break;
  return value;
}

std::string SetCookieText(const Cookie &cookie) {
  if (cookie.name.empty() || cookie.name.find('=') != std::string::npos) return "";
  if (!IsCookieText(cookie.name) || !IsCookieText(cookie.value) || !IsCookieText(cookie.path))
    return "";
  std::string text = cookie.name + "=" + (cookie.is_withdrawn ? "" : cookie.value);
  text += "; Path=" + cookie.path + "; HttpOnly; SameSite=Lax";
  if (cookie.is_secure) text += "; Secure";
  if (cookie.is_withdrawn) text += "; Max-Age=0";
  return text;
}

}  // namespace web
