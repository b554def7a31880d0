#include "http/cookies.h"

#include <algorithm>

#include "http/text.h"

namespace web {
namespace {

std::string_view Unquoted(std::string_view value) {
  if (value.size() >= 2 && value.front() == '"' && value.back() == '"')
    return value.substr(1, value.size() - 2);
  return value;
}

/// Looks for the next cookie of a name in one header field, and takes away all up to it.
/// @return whether there is one.
bool FindNext(std::string_view &header, std::string_view name, std::string_view &value) {
  while (!header.empty()) {
    std::string_view pair = TakePart(header, ';');
    if (Trimmed(TakePart(pair, '=')) != name) continue;
    value = Unquoted(Trimmed(pair));
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
  for (const Fields::Field &field : request.headers) {
    std::string_view rest = field.second;
    if (IsSameText(field.first, "Cookie") && FindNext(rest, name, value)) break;
  }
  return value;
}

std::vector<std::string_view> FindCookies(const Request &request, std::string_view name) {
  std::vector<std::string_view> values;
  for (const Fields::Field &field : request.headers) {
    if (!IsSameText(field.first, "Cookie")) continue;
    std::string_view rest = field.second;
    for (std::string_view value; FindNext(rest, name, value);) values.push_back(value);
  }
  return values;
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
