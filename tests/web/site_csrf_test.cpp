// Forms that are not ours.
#include "site_support.h"

namespace {

using testing::HasSubstr;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::FieldList;
using velk_test::HeaderList;
using web::Response;

const char *const kLink = "/sharing/abc";
const char *const kKeyCookie = "sharing_csrf";

class SiteForms : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (!IsSkipped()) StoreWithPassword("abc");
  }

  void ExpectRefused(Browser &browser, const std::string &token, const HeaderList &headers = {}) {
    Response response = browser.Post(kLink, {{"csrf", token}, {"password", "secret"}}, headers);
    EXPECT_EQ(403, response.status);
    EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
    EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
  }
};

TEST_F(SiteForms, WithoutATokenAreRefusedWithAFreshForm) {
  Browser browser(site());
  browser.Get(kLink);
  Response response = browser.Post(kLink, {{"password", "secret"}});
  EXPECT_EQ(403, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"csrf\""));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(SiteForms, WithoutTheCookieAreRefused) {
  Browser owner(site());
  Browser browser(site());
  ExpectRefused(browser, owner.TokenOf(kLink));
}

TEST_F(SiteForms, WithAMadeUpTokenAreRefused) {
  Browser browser(site());
  browser.Get(kLink);
  for (const std::string &token : {std::string(), std::string("x"), std::string(64, '0'),
                                   browser.CookieFor(kLink, kKeyCookie)})
    ExpectRefused(browser, token);
}

TEST_F(SiteForms, WithAnotherBrowsersTokenAreRefused) {
  Browser other(site());
  Browser browser(site());
  browser.Get(kLink);
  ExpectRefused(browser, other.TokenOf(kLink));
}

TEST_F(SiteForms, WithAnotherLinksTokenAreRefused) {
  StoreWithPassword("other");
  Browser browser(site());
  browser.Get(kLink);
  browser.SetCookie("/sharing/other", kKeyCookie, browser.CookieFor(kLink, kKeyCookie));
  ExpectRefused(browser, browser.TokenOf("/sharing/other"));
}

TEST_F(SiteForms, WithATokenOfAnotherSecretAreRefused) {
  web::SiteSettings settings;
  settings.form_secret = "another secret of another site..";
  web::Site other(settings);
  Browser elsewhere(other);
  Browser browser(site());
  const std::string token = elsewhere.TokenOf(kLink);
  browser.SetCookie(kLink, kKeyCookie, elsewhere.CookieFor(kLink, kKeyCookie));
  ExpectRefused(browser, token);
}

TEST_F(SiteForms, FromAnotherSiteAreRefused) {
  Browser browser(site());
  const std::string token = browser.TokenOf(kLink);
  ExpectRefused(browser, token, {{"Sec-Fetch-Site", "cross-site"}});
  ExpectRefused(browser, token, {{"Sec-Fetch-Site", "same-site"}, {"Origin", "null"}});
  ExpectRefused(browser, token, {{"Host", "share.example"}, {"Origin", "https://evil.example"}});
}

TEST_F(SiteForms, OfOurPagesAreTaken) {
  Browser browser(site());
  EXPECT_EQ(303, browser
                     .Submit(kLink, {{"password", "secret"}},
                             {{"Sec-Fetch-Site", "same-origin"}, {"Origin", "null"}})
                     .status);
}

TEST_F(SiteForms, AreTakenByEveryProcess) {
  web::SiteSettings settings;
  settings.form_secret = "0123456789abcdef0123456789abcdef";
  web::Site second(settings);
  Browser browser(site());
  const std::string token = browser.TokenOf(kLink);
  Browser with_other_process(second);
  with_other_process.SetCookie(kLink, kKeyCookie, browser.CookieFor(kLink, kKeyCookie));
  EXPECT_EQ(303, with_other_process.Post(kLink, {{"csrf", token}, {"password", "secret"}}).status);
}

TEST_F(SiteForms, OfTwoPagesOfOneLinkBothWork) {
  Browser browser(site());
  const std::string first = browser.TokenOf(kLink);
  browser.TokenOf(kLink);
  EXPECT_EQ(303, browser.Post(kLink, {{"csrf", first}, {"password", "secret"}}).status);
}

TEST_F(SiteForms, ToLeaveNeedATokenToo) {
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ(403, browser.Post(std::string(kLink) + "/logout", {}).status);
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token"));
}

TEST_F(SiteForms, AreNotNeededByApiClients) {
  Browser client(site());
  EXPECT_EQ(200, client
                     .Post(kLink, {{"password", "secret"}},
                           {{"X-Velk-Sharing", ""}, {"Accept", "application/json"}})
                     .status);
}

TEST_F(SiteForms, OfApiClientsDoNotComeFromOtherSites) {
  Browser client(site());
  EXPECT_EQ(403, client
                     .Post(kLink, {{"password", "secret"}},
                           {{"X-Velk-Sharing", ""}, {"Sec-Fetch-Site", "cross-site"}})
                     .status);
}

TEST_F(SiteForms, HaveAKeyThatNoScriptReads) {
  Browser browser(site());
  EXPECT_THAT(
      velk_test::HeadOf(browser.Get(kLink)),
      testing::ContainsRegex("Set-Cookie: sharing_csrf=[0-9a-f]{32}; Path=/sharing/abc; HttpOnly; "
                             "SameSite=Lax\n"));
}

}  // namespace
