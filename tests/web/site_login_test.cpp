// Getting in with a password, and out again.
#include <velk/velksdk.h>

#include <algorithm>

#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeadOf;
using velk_test::LogCapture;
using web::Response;

const char *const kLink = "/sharing/abc";

class SiteLogin : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (!IsSkipped()) StoreWithPassword("abc");
  }
};

TEST_F(SiteLogin, APasswordIsAskedFor) {
  Browser browser(site());
  Response response = browser.Get(kLink);
  EXPECT_EQ(200, response.status);
  const std::string body = BodyOf(response);
  EXPECT_THAT(body, HasSubstr("name=\"password\""));
  EXPECT_THAT(body, Not(HasSubstr("hello.txt")));
  EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
}

TEST_F(SiteLogin, TheRightPasswordLeadsToWhatIsShared) {
  Browser browser(site());
  Response login = browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ(303, login.status);
  EXPECT_EQ(kLink, login.headers.Get("Location"));
  EXPECT_EQ(Value("SELECT session_id FROM session"), browser.CookieFor(kLink, "sharing_sid"));
  Response page = browser.Get(kLink);
  EXPECT_EQ(200, page.status);
  EXPECT_THAT(BodyOf(page), HasSubstr("hello.txt"));
}

TEST_F(SiteLogin, AWrongPasswordIsAskedForAgain) {
  Browser browser(site());
  Response response = browser.Submit(kLink, {{"password", "wrong"}});
  EXPECT_EQ(401, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"password\""));
  EXPECT_THAT(BodyOf(response), HasSubstr("role=\"alert\""));
  EXPECT_THAT(BodyOf(response), Not(HasSubstr("wrong\"")));
  EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
  EXPECT_EQ(-9, browser.note().code);
}

TEST_F(SiteLogin, APasswordThatIsMissingIsAskedForAgain) {
  Browser browser(site());
  EXPECT_EQ(401, browser.Submit(kLink, {}).status);
  EXPECT_EQ(-3, browser.note().code);
}

TEST_F(SiteLogin, APasswordIsNotCutAtAZeroByte) {
  Browser browser(site());
  const std::string token = browser.TokenOf(kLink);
  EXPECT_EQ(400, browser.Post(kLink, {{"csrf", token}, {"password", {"secret\0x", 8}}}).status);
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(SiteLogin, TheCookieIsTheLinksAlone) {
  Browser browser(site());
  const std::string head = HeadOf(browser.Submit(kLink, {{"password", "secret"}}));
  EXPECT_THAT(head, testing::ContainsRegex("Set-Cookie: sharing_sid=[A-Za-z0-9_-]{32}; "
                                           "Path=/sharing/abc; HttpOnly; SameSite=Lax\n"));
}

TEST_F(SiteLogin, TheCookieIsSecureByHttps) {
  Browser browser(site());
  browser.UseHttps();
  const std::string head = HeadOf(browser.Submit(kLink, {{"password", "secret"}}));
  EXPECT_THAT(head, testing::ContainsRegex("Set-Cookie: sharing_sid=[^;]*; Path=/sharing/abc; "
                                           "HttpOnly; SameSite=Lax; Secure\n"));
}

TEST_F(SiteLogin, TheSessionIsInNoAddressAndNoBody) {
  Browser browser(site());
  Response login = browser.Submit(kLink, {{"password", "secret"}});
  const std::string session = browser.CookieFor(kLink, "sharing_sid");
  EXPECT_THAT(std::string(login.headers.Get("Location")), Not(HasSubstr(session)));
  EXPECT_THAT(BodyOf(login), Not(HasSubstr(session)));
  Response page = browser.Get(kLink);
  EXPECT_THAT(BodyOf(page), Not(HasSubstr(session)));
}

TEST_F(SiteLogin, ALoginNeverContinuesASessionThatTheBrowserBrought) {
  Browser attacker(site());
  attacker.Submit(kLink, {{"password", "secret"}});
  const std::string planted = attacker.CookieFor(kLink, "sharing_sid");
  Browser victim(site());
  victim.SetCookie(kLink, "sharing_sid", planted);
  // The page is what an expired session gives: the attacker logs out first.
  RunSql("DELETE FROM token");
  ASSERT_EQ(303, victim.Submit(kLink, {{"password", "secret"}}).status);
  EXPECT_NE(planted, victim.CookieFor(kLink, "sharing_sid"));
  Response attackers = attacker.Get(kLink);
  EXPECT_THAT(BodyOf(attackers), HasSubstr("name=\"password\""));
}

TEST_F(SiteLogin, ALoginWithALiveSessionMakesAnotherOne) {
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  const std::string first = browser.CookieFor(kLink, "sharing_sid");
  Response page = browser.Get(kLink);
  const std::string body = BodyOf(page);
  const size_t at = body.find("name=\"csrf\" value=\"");
  ASSERT_NE(std::string::npos, at);
  const std::string token = body.substr(at + 19, 64);
  ASSERT_EQ(303, browser.Post(kLink, {{"csrf", token}, {"password", "secret"}}).status);
  EXPECT_NE(first, browser.CookieFor(kLink, "sharing_sid"));
}

TEST_F(SiteLogin, AMadeUpSessionOpensNothing) {
  for (const char *made_up : {"unknown", "' OR '1'='1", "", "%00", "a b", "\"\""}) {
    Browser browser(site());
    browser.SetCookie(kLink, "sharing_sid", made_up);
    Response response = browser.Get(kLink);
    EXPECT_THAT(BodyOf(response), HasSubstr("name=\"password\"")) << made_up;
  }
}

TEST_F(SiteLogin, ASessionOfAnotherLinkOpensNothing) {
  StoreOpen("open");
  Browser browser(site());
  browser.Get("/sharing/open");
  const std::string session = browser.CookieFor("/sharing/open", "sharing_sid");
  ASSERT_FALSE(session.empty());
  browser.SetCookie(kLink, "sharing_sid", session);
  Response response = browser.Get(kLink);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"password\""));
}

TEST_F(SiteLogin, ABlockedAddressIsToldWhenToComeAgain) {
  const LogCapture quiet;
  ASSERT_EQ(0, VELKAutoBlockAdd("192.0.2.1", "SHARING", 60));
  Browser browser(site());
  Response response = browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ(429, response.status);
  EXPECT_EQ("600", response.headers.Get("Retry-After"));
  EXPECT_EQ(-8, browser.note().code);
}

TEST_F(SiteLogin, WrongPasswordsBlockTheAddressInTheEnd) {
  const LogCapture quiet;
  Browser browser(site(), "198.51.100.9");
  for (int count = 0; count < 10; ++count)
    ASSERT_EQ(401, browser.Submit(kLink, {{"password", "wrong"}}).status);
  EXPECT_EQ(429, browser.Submit(kLink, {{"password", "secret"}}).status);
}

TEST_F(SiteLogin, AnOpenLinkDoesNotWipeTheFailuresOff) {
  const LogCapture quiet;
  StoreOpen("open");
  for (int count = 0; count < 10; ++count) {
    Browser browser(site(), "198.51.100.9");
    ASSERT_EQ(200, Browser(site(), "198.51.100.9").Get("/sharing/open").status);
    ASSERT_EQ(401, browser.Submit(kLink, {{"password", "wrong"}}).status);
  }
  Browser browser(site(), "198.51.100.9");
  EXPECT_EQ(429, browser.Submit(kLink, {{"password", "secret"}}).status);
}

TEST_F(SiteLogin, AnAddressThatIsNoneIsAFailureOfOurs) {
  const LogCapture quiet;
  Browser browser(site(), "nowhere");
  EXPECT_EQ(503, browser.Submit(kLink, {{"password", "secret"}}).status);
  EXPECT_EQ(-4, browser.note().code);
}

TEST_F(SiteLogin, ALogoutTakesTheGrantAndTheCookieAway) {
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  const std::string session = browser.CookieFor(kLink, "sharing_sid");
  Response response = browser.Submit(kLink, std::string(kLink) + "/logout", {});
  EXPECT_EQ(303, response.status);
  EXPECT_EQ("/sharing/abc?logged-out", response.headers.Get("Location"));
  EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM token"));
  browser.SetCookie(kLink, "sharing_sid", session);
  Response page = browser.Get(kLink);
  EXPECT_THAT(BodyOf(page), HasSubstr("name=\"password\""));
}

TEST_F(SiteLogin, AVisitorWhoLeftAnOpenLinkStaysOutside) {
  StoreOpen("open");
  Browser browser(site());
  const std::string token = browser.TokenOf("/sharing/open");
  browser.Get("/sharing/open");
  Response left = browser.Post("/sharing/open/logout", {{"csrf", token}});
  ASSERT_EQ(303, left.status);
  Response page = browser.Get(std::string(left.headers.Get("Location")));
  EXPECT_EQ(200, page.status);
  EXPECT_THAT(BodyOf(page), Not(HasSubstr("hello.txt")));
  EXPECT_EQ("", browser.CookieFor("/sharing/open", "sharing_sid"));
}

TEST_F(SiteLogin, TheAccessLogLearnsNothingSecret) {
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ("login", browser.note().route);
  EXPECT_EQ("a…", browser.note().link);
  EXPECT_EQ(1, browser.note().code);
  EXPECT_EQ("VELK_SHARING_LOGIN_OK", browser.note().code_name);
}

TEST_F(SiteLogin, APostToAnythingElseIsNotAllowed) {
  Browser browser(site());
  Response response = browser.Post("/sharing/abc/sub/", {{"password", "secret"}});
  EXPECT_EQ(405, response.status);
  EXPECT_EQ("GET, HEAD", response.headers.Get("Allow"));
}

TEST_F(SiteLogin, AFormOfAnotherTypeIsRefused) {
  web::Request request;
  request.method = "POST";
  request.path = kLink;
  request.remote_address = "192.0.2.1";
  request.body = "{\"password\":\"secret\"}";
  web::AccessNote note;
  for (const char *type : {"", "application/json", "text/plain", "multipart/form-data"}) {
    request.headers.Set("Content-Type", type);
    EXPECT_EQ(415, site().Handle(request, note).status) << type;
  }
}

TEST_F(SiteLogin, AFormThatIsTooLargeIsRefused) {
  Browser browser(site());
  EXPECT_EQ(413, browser.Post(kLink, {{"password", std::string(64 * 1024, 'x')}}).status);
}

TEST_F(SiteLogin, ALinkThatHoldsVisitorsToTheirAddressAsksAnotherOneAgain) {
  const LogCapture quiet;
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  Browser elsewhere(site(), "192.0.2.2");
  elsewhere.SetCookie(kLink, "sharing_sid", browser.CookieFor(kLink, "sharing_sid"));
  Response response = elsewhere.Get(kLink);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"password\""));
  EXPECT_EQ(-2, elsewhere.note().code);
}

TEST_F(SiteLogin, AStorageFailureIsOurs) {
  const LogCapture quiet;
  Browser browser(site());
  const std::string token = browser.TokenOf(kLink);
  RunSql("CREATE TRIGGER full BEFORE INSERT ON session BEGIN SELECT RAISE(ABORT, 'full'); END");
  Response response = browser.Post(kLink, {{"csrf", token}, {"password", "secret"}});
  RunSql("DROP TRIGGER full");
  EXPECT_EQ(503, response.status);
  EXPECT_FALSE(response.headers.Get("Retry-After").empty());
  EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
}

}  // namespace
