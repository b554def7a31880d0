#ifndef VELKSHARING_WEB_HTTP_COOKIES_H
#define VELKSHARING_WEB_HTTP_COOKIES_H

#include <string>
#include <string_view>
#include <vector>

#include "http/request.h"

namespace web {

/// The value of a cookie that a request brings, without quotes around it; "" when there is none.
/// The first of equal names counts: browsers send that of the longest path first.
std::string_view FindCookie(const Request &request, std::string_view name);

/// The values of all cookies of a name, in the order in which they come.
std::vector<std::string_view> FindCookies(const Request &request, std::string_view name);

/// A cookie for the browser. It is always HttpOnly and SameSite=Lax, and ends with the browser's
/// session.
struct Cookie {
  std::string name;
  std::string value;
  std::string path;
  bool is_secure = false;     ///< Only by https.
  bool is_withdrawn = false;  ///< The browser shall forget it; the value plays no part.
};

/// The value of Set-Cookie.
/// @return "" when name, value or path hold what a cookie cannot: control characters, blanks,
///         quotes, commas, semicolons, backslashes, bytes beyond ASCII; "=" in the name.
std::string SetCookieText(const Cookie &cookie);

}  // namespace web

#endif
