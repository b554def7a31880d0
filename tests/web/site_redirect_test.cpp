// Sending visitors on, to where the owner says and nowhere else.
#include "site_open_redirects.h"
#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::Contains;
using testing::HasSubstr;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeadOf;
using velk_test::LogCapture;
using web::Response;

const char *const kTarget = "https://photos.example/album?id=7";
const char *const kLink = "/sharing/abc";

class SiteRedirect : public velk_test::SiteTest {
 protected:
  Entry Redirecting(Entry::RedirectType type, const std::string &target) {
    Entry entry = FolderLink("abc");
    entry.set_redirect_type(type).set_redirect_uri(target);
    return entry;
  }
};

TEST_F(SiteRedirect, AlwaysSendsVisitorsOn) {
  Store(Redirecting(Entry::REDIRECT_ALWAYS, kTarget));
  Browser browser(site());
  for (int visit = 0; visit < 2; ++visit) {
    Response response = browser.Get(kLink);
    EXPECT_EQ(303, response.status);
    EXPECT_EQ(kTarget, response.headers.Get("Location"));
    EXPECT_EQ("redirect", browser.note().route);
  }
}

TEST_F(SiteRedirect, NobodyLearnsTheTargetBeforeTheLogin) {
  Store(WithPassword(Redirecting(Entry::REDIRECT_ALWAYS, kTarget)));
  Browser browser(site());
  Response page = browser.Get(kLink);
  EXPECT_THAT(HeadOf(page) + BodyOf(page), Not(HasSubstr("photos.example")));
}

TEST_F(SiteRedirect, ALoginLeadsOnByAPageOfItsOwn) {
  Store(WithPassword(Redirecting(Entry::REDIRECT_ALWAYS, kTarget)));
  Browser browser(site());
  Response response = browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("https://photos.example/album"));
  EXPECT_NE("", browser.CookieFor(kLink, "sharing_sid"));
  EXPECT_EQ(303, browser.Get(kLink).status);
}

TEST_F(SiteRedirect, AlwaysNeedsNoFiles) {
  Entry entry = LinkTo("abc", "/no/such/file");
  entry.set_redirect_type(Entry::REDIRECT_ALWAYS).set_redirect_uri(kTarget);
  Store(entry);
  EXPECT_EQ(303, Browser(site()).Get(kLink).status);
}

TEST_F(SiteRedirect, UrlParamOffersTheTargetOnThePage) {
  Store(Redirecting(Entry::REDIRECT_URLPARAM, kTarget));
  Response response = Browser(site()).Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("https://photos.example/album"));
}

TEST_F(SiteRedirect, UrlParamIsHandedToPrograms) {
  Store(Redirecting(Entry::REDIRECT_URLPARAM, kTarget));
  Response response = Browser(site()).Get(kLink, {{"Accept", "application/json"}});
  EXPECT_EQ(kTarget, velk_test::JsonOf(response)["redirect"].asString());
}

TEST_F(SiteRedirect, WithoutARedirectTheTargetPlaysNoPart) {
  Store(Redirecting(Entry::REDIRECT_NONE, kTarget));
  Response response = Browser(site()).Get(kLink);
  EXPECT_THAT(HeadOf(response) + BodyOf(response), Not(HasSubstr("photos.example")));
}

TEST_F(SiteRedirect, ATargetThatIsNoWebAddressIsIgnoredAndLogged) {
  for (const auto type : {Entry::REDIRECT_ALWAYS, Entry::REDIRECT_URLPARAM}) {
    RunSql("DELETE FROM entry");
    Store(Redirecting(type, "javascript:alert(1)"));
    const LogCapture log;
    Response response = Browser(site()).Get(kLink);
    EXPECT_EQ(200, response.status);
    EXPECT_THAT(BodyOf(response), Not(HasSubstr("javascript:")));
    EXPECT_THAT(log.Texts(), Contains(HasSubstr("redirect target")));
  }
}

TEST_F(SiteRedirect, StoredTricksLeadNowhere) {
  const LogCapture quiet;
  Store(Redirecting(Entry::REDIRECT_ALWAYS, kTarget));
  Browser browser(site());
  browser.Get(kLink);
  for (const std::string &spelling : velk_test::OpenRedirects()) {
    if (spelling.find('\0') != std::string::npos) continue;  // The database holds no such text.
    RunSql("DELETE FROM entry");
    Store(Redirecting(Entry::REDIRECT_ALWAYS, spelling));
    Response response = Browser(site()).Get(kLink);
    EXPECT_EQ(200, response.status) << spelling;
    EXPECT_EQ(nullptr, response.headers.Find("Location")) << spelling;
  }
}

TEST_F(SiteRedirect, NoRequestSaysWhereToGo) {
  Store(WithPassword(Redirecting(Entry::REDIRECT_NONE, "")));
  StoreWithPassword("other");
  for (const std::string &spelling : velk_test::OpenRedirects()) {
    for (const char *parameter : {"redirect", "redirect_uri", "url", "next", "r"}) {
      Browser browser(site());
      const std::string query = "?" + velk_test::Encoded({{parameter, spelling}});
      if (spelling.find('\0') != std::string::npos) break;
      Response page = browser.Get(kLink + query);
      ASSERT_EQ(200, page.status) << spelling;
      EXPECT_EQ(nullptr, page.headers.Find("Location"));
      EXPECT_THAT(BodyOf(page), Not(HasSubstr("evil.example")));
      if (parameter[0] != 'n') continue;
      Response login = browser.Submit(kLink, {{"password", "secret"}, {parameter, spelling}},
                                      {{"X-Forwarded-Host", "evil.example"}});
      ASSERT_EQ(303, login.status) << spelling;
      EXPECT_EQ(kLink, login.headers.Get("Location")) << spelling;
    }
  }
}

TEST_F(SiteRedirect, NoPathLeadsToAnotherHost) {
  StoreOpen("abc");
  for (const std::string &spelling : velk_test::OpenRedirects()) {
    for (const std::string &path : {spelling, "/sharing" + spelling, kLink + ("/" + spelling)}) {
      Response response = Browser(site()).Get(path);
      EXPECT_EQ(nullptr, response.headers.Find("Location")) << path;
    }
  }
}

TEST_F(SiteRedirect, ATargetCannotAddAField) {
  const LogCapture quiet;
  Store(Redirecting(Entry::REDIRECT_ALWAYS, "https://x.example/\r\nSet-Cookie: sharing_sid=evil"));
  EXPECT_THAT(HeadOf(Browser(site()).Get(kLink)), Not(HasSubstr("evil")));
}

}  // namespace
