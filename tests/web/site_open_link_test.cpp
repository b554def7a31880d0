// Links without protection, and what counts as a use.
#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeaderList;
using velk_test::LogCapture;
using web::Response;

const char *const kLink = "/sharing/abc";

class SiteOpenLink : public velk_test::SiteTest {
 protected:
  void StoreLimited(int uses) {
    Entry entry = FolderLink("abc");
    entry.set_expire_times(uses);
    Store(entry);
  }

  static std::string Uses() { return Value("SELECT use_count FROM entry"); }
};

TEST_F(SiteOpenLink, LetsVisitorsInAtOnce) {
  StoreOpen("abc");
  Browser browser(site());
  Response response = browser.Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("hello.txt"));
  EXPECT_EQ(Value("SELECT session_id FROM session"), browser.CookieFor(kLink, "sharing_sid"));
}

TEST_F(SiteOpenLink, CountsAVisitOnce) {
  StoreOpen("abc");
  Browser browser(site());
  browser.Get(kLink);
  browser.Get(std::string(kLink) + "/hello.txt?download", {{"Range", "bytes=0-3"}});
  browser.Head(kLink);
  browser.Get(kLink);
  EXPECT_EQ("1", Uses());
}

TEST_F(SiteOpenLink, IsNotEnteredByAHead) {
  StoreOpen("abc");
  Browser browser(site());
  EXPECT_EQ(200, browser.Head(kLink).status);
  EXPECT_EQ("", browser.CookieFor(kLink, "sharing_sid"));
  EXPECT_EQ("0", Uses());
}

TEST_F(SiteOpenLink, IsNotEnteredByWhatIsFetchedInAdvance) {
  StoreOpen("abc");
  for (const auto &header : HeaderList{{"Purpose", "prefetch"},
                                       {"Sec-Purpose", "prefetch;prerender"},
                                       {"X-Purpose", "preview"},
                                       {"X-Moz", "prefetch"}}) {
    Browser browser(site());
    Response response = browser.Get(kLink, {header});
    EXPECT_THAT(BodyOf(response), Not(HasSubstr("hello.txt"))) << header.first;
  }
  EXPECT_EQ("0", Uses());
}

TEST_F(SiteOpenLink, WithAUseLimitAsksForAClick) {
  StoreLimited(2);
  Browser browser(site());
  Response response = browser.Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), Not(HasSubstr("hello.txt")));
  EXPECT_EQ("0", Uses());
  EXPECT_EQ(303, browser.Submit(kLink, {}).status);
  EXPECT_EQ("1", Uses());
  Response page = browser.Get(kLink);
  EXPECT_THAT(BodyOf(page), HasSubstr("hello.txt"));
}

TEST_F(SiteOpenLink, IsUsedUpAfterItsLastUse) {
  StoreLimited(2);
  EXPECT_EQ(303, Browser(site()).Submit(kLink, {}).status);
  Browser late(site());
  const std::string token = late.TokenOf(kLink);
  EXPECT_EQ(303, Browser(site()).Submit(kLink, {}).status);
  EXPECT_EQ(404, late.Post(kLink, {{"csrf", token}}).status);
  EXPECT_EQ("2", Uses());
}

TEST_F(SiteOpenLink, WithAUseLimitNeedsTheLock) {
  StoreLimited(2);
  web::SiteSettings settings;
  settings.runtime_folder = runtime_.File("none");
  settings.form_secret = "0123456789abcdef0123456789abcdef";
  web::Site without_lock(settings);
  const LogCapture quiet;
  EXPECT_EQ(503, Browser(without_lock).Submit(kLink, {}).status);
  EXPECT_EQ("0", Uses());
}

}  // namespace
