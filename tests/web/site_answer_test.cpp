// What every answer has in common; health; style sheet.
#include <velksharing/database.h>

#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeadOf;
using velk_test::LogCapture;
using web::Response;

class SiteAnswer : public velk_test::SiteTest {
 protected:
  Response Send(const std::string &method, const std::string &path) {
    web::Request request;
    request.method = method;
    request.path = path;
    request.remote_address = "192.0.2.1";
    web::AccessNote note;
    return site().Handle(request, note);
  }
};

TEST_F(SiteAnswer, HasTheSecurityFieldsWhateverItIs) {
  const LogCapture quiet;
  StoreOpen("open");
  StoreWithPassword("abc");
  for (const char *target :
       {"/sharing/open", "/sharing/open/hello.txt", "/sharing/open/hello.txt?download",
        "/sharing/open?zip", "/sharing/abc", "/sharing/unknown", "/sharing-health", "/nowhere"}) {
    Response response = Browser(site()).Get(target);
    const std::string policy(response.headers.Get("Content-Security-Policy"));
    EXPECT_THAT(policy, HasSubstr("default-src 'none'")) << target;
    EXPECT_THAT(policy, HasSubstr("frame-ancestors 'none'")) << target;
    EXPECT_THAT(policy, Not(HasSubstr("unsafe-eval"))) << target;
    EXPECT_EQ("nosniff", response.headers.Get("X-Content-Type-Options")) << target;
    EXPECT_EQ("no-referrer", response.headers.Get("Referrer-Policy")) << target;
    EXPECT_THAT(std::string(response.headers.Get("X-Robots-Tag")), HasSubstr("noindex")) << target;
    EXPECT_NE(nullptr, response.headers.Find("Cache-Control")) << target;
    EXPECT_EQ(nullptr, response.headers.Find("Strict-Transport-Security")) << target;
    EXPECT_EQ(nullptr, response.headers.Find("Access-Control-Allow-Origin")) << target;
  }
}

TEST_F(SiteAnswer, OfAPageIsNotKept) {
  StoreOpen("open");
  StoreWithPassword("abc");
  for (const char *target : {"/sharing/open", "/sharing/abc", "/sharing/unknown"})
    EXPECT_EQ("no-store", Browser(site()).Get(target).headers.Get("Cache-Control")) << target;
}

TEST_F(SiteAnswer, ToAnotherMethodNamesThoseThatThereAre) {
  StoreOpen("abc");
  for (const char *method :
       {"PUT", "DELETE", "OPTIONS", "TRACE", "CONNECT", "PATCH", "PROPFIND", "get", "", "GET "}) {
    Response response = Send(method, "/sharing/abc");
    EXPECT_EQ(405, response.status) << method;
    EXPECT_EQ("GET, HEAD, POST", response.headers.Get("Allow")) << method;
    EXPECT_EQ(405, Send(method, "/sharing/unknown").status) << method;
  }
  EXPECT_EQ(405, Send("POST", "/sharing-health").status);
}

TEST_F(SiteAnswer, IsInTheVisitorsLanguage) {
  StoreWithPassword("abc");
  Response english = Browser(site()).Get("/sharing/abc", {{"Accept-Language", "fr, en;q=0.5"}});
  Response german = Browser(site()).Get("/sharing/abc", {{"Accept-Language", "de-AT, en;q=0.5"}});
  EXPECT_THAT(BodyOf(english), HasSubstr("lang=\"en\""));
  EXPECT_THAT(BodyOf(german), HasSubstr("lang=\"de\""));
}

TEST_F(SiteAnswer, HoldsNothingRawFromTheRequest) {
  StoreWithPassword("abc");
  const std::string evil = "evil\r\nSet-Cookie: sharing_sid=evil";
  for (const char *name : {"Cookie", "Accept", "Accept-Language", "Host", "Origin", "Range",
                           "If-None-Match", "X-Velk-Sharing", "Referer", "User-Agent"}) {
    Response response = Browser(site()).Get("/sharing/abc", {{name, evil}});
    EXPECT_THAT(HeadOf(response), Not(HasSubstr("evil"))) << name;
  }
  Response response = Browser(site()).Get("/sharing/abc/evil%0d%0aSet-Cookie:%20a=evil");
  EXPECT_THAT(HeadOf(response), Not(HasSubstr("evil")));
}

TEST_F(SiteAnswer, TellsThatItIsHealthy) {
  Response response = Browser(site()).Get("/sharing-health");
  EXPECT_EQ(200, response.status);
  EXPECT_EQ("ok\n", BodyOf(response));
  EXPECT_FALSE(site().NeedsNewProcess());
}

TEST_F(SiteAnswer, TellsThatTheDatabaseDoesNotAnswer) {
  RunSql("ALTER TABLE entry RENAME TO gone");
  Response response = Browser(site()).Get("/sharing-health");
  Response page = Browser(site()).Get("/sharing/abc");
  RunSql("ALTER TABLE gone RENAME TO entry");
  EXPECT_EQ(503, response.status);
  EXPECT_EQ(503, page.status);
}

TEST_F(SiteAnswer, BringsWhatPagesNeed) {
  StoreWithPassword("abc");
  Response page = Browser(site()).Get("/sharing/abc");
  const std::string body = BodyOf(page);
  const size_t at = body.find("/sharing/-/");
  ASSERT_NE(std::string::npos, at);
  Response asset = Browser(site()).Get(body.substr(at, body.find_first_of("\"#", at) - at));
  EXPECT_EQ(200, asset.status);
  EXPECT_THAT(std::string(asset.headers.Get("Cache-Control")), HasSubstr("immutable"));
}

TEST_F(SiteAnswer, ToWhatCouldNotBeReadIsAPageToo) {
  for (const int status : {400, 408, 413, 414, 431}) {
    Response response = site().Refuse({}, status);
    EXPECT_EQ(status, response.status);
    EXPECT_EQ("nosniff", response.headers.Get("X-Content-Type-Options"));
    EXPECT_FALSE(BodyOf(response).empty());
  }
}

TEST_F(SiteAnswer, LiesWhereTheSiteSays) {
  web::SiteSettings settings;
  settings.base_path = "";
  settings.runtime_folder = runtime_.path();
  settings.form_secret = "0123456789abcdef0123456789abcdef";
  web::Site at_root(settings);
  StoreWithPassword("abc");
  Browser browser(at_root);
  EXPECT_EQ("/abc", browser.Submit("/abc", {{"password", "secret"}}).headers.Get("Location"));
  EXPECT_NE("", browser.CookieFor("/abc", "sharing_sid"));
  EXPECT_EQ(200, browser.Get("/-health").status);
}

}  // namespace
