#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "http/cookies.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using web::Cookie;
using web::FindCookie;
using web::FindCookies;
using web::Request;
using web::SetCookieText;

Request RequestWith(std::initializer_list<const char *> cookie_fields) {
  Request request;
  for (const char *field : cookie_fields) request.headers.Add("Cookie", field);
  return request;
}

Cookie Sample() {
  Cookie cookie;
  cookie.name = "sid";
  cookie.value = "abc";
  cookie.path = "/sharing/x";
  return cookie;
}

TEST(Cookies, FindsAValue) {
  EXPECT_EQ("2", FindCookie(RequestWith({"a=1; b=2 ;c=3"}), "b"));
  EXPECT_EQ("3", FindCookie(RequestWith({"a=1", "c=3"}), "c"));
  EXPECT_EQ("x=y", FindCookie(RequestWith({"a=x=y"}), "a"));
}

TEST(Cookies, TakesQuotesAway) {
  EXPECT_EQ("1", FindCookie(RequestWith({"a=\"1\""}), "a"));
  EXPECT_EQ("\"", FindCookie(RequestWith({"a=\""}), "a"));
}

TEST(Cookies, TheFirstOfEqualNamesCounts) {
  EXPECT_EQ("1", FindCookie(RequestWith({"a=1; a=2", "a=3"}), "a"));
}

TEST(Cookies, FindsNothingInWhatIsNoCookie) {
  for (const char *field : {"", ";;;", "a", "=1", "b=a=1", "A=1", "a b=1"})
    EXPECT_EQ("", FindCookie(RequestWith({field}), "a")) << field;
}

TEST(Cookies, FindsAllOfAName) {
  EXPECT_THAT(FindCookies(RequestWith({"a=1; b=2; a=\"3\"", "c=4", "a=5;a="}), "a"),
              ElementsAre("1", "3", "5", ""));
  EXPECT_THAT(FindCookies(RequestWith({"b=a=1; A=1; aa=1", "a", ""}), "a"), ElementsAre(""));
  EXPECT_THAT(FindCookies(Request(), "a"), IsEmpty());
}

TEST(Cookies, WritesACookie) {
  Cookie cookie = Sample();
  EXPECT_EQ("sid=abc; Path=/sharing/x; HttpOnly; SameSite=Lax", SetCookieText(cookie));
  cookie.is_secure = true;
  EXPECT_EQ("sid=abc; Path=/sharing/x; HttpOnly; SameSite=Lax; Secure", SetCookieText(cookie));
}

TEST(Cookies, WithdrawsACookie) {
  Cookie cookie = Sample();
  cookie.is_withdrawn = true;
  EXPECT_EQ("sid=; Path=/sharing/x; HttpOnly; SameSite=Lax; Max-Age=0", SetCookieText(cookie));
}

TEST(Cookies, WritesNothingThatCouldBeReadAsMore) {
  for (const char *bad : {"a;b", "a b", "a\r\nb", "a,b", "a\"b", "a\\b", "ä", "a\tb"}) {
    Cookie cookie = Sample();
    cookie.value = bad;
    EXPECT_EQ("", SetCookieText(cookie)) << bad;
    cookie = Sample();
    cookie.path = bad;
    EXPECT_EQ("", SetCookieText(cookie)) << bad;
    cookie = Sample();
    cookie.name = bad;
    EXPECT_EQ("", SetCookieText(cookie)) << bad;
  }
  Cookie cookie = Sample();
  cookie.name = "a=b";
  EXPECT_EQ("", SetCookieText(cookie));
}

}  // namespace
