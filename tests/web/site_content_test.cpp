// What a visitor who is in can have.
#include <sys/stat.h>

#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeadOf;
using velk_test::LogCapture;
using web::Response;

class SiteContent : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (!IsSkipped()) StoreOpen("abc");
  }

  Response Get(const std::string &below, const velk_test::HeaderList &headers = {}) {
    return browser().Get("/sharing/abc" + below, headers);
  }

  Browser &browser() {
    if (!browser_) browser_ = std::make_unique<Browser>(site());
    return *browser_;
  }

  std::unique_ptr<Browser> browser_;
};

TEST_F(SiteContent, AFolderIsListed) {
  for (const char *below : {"", "/"}) {
    Response response = Get(below);
    EXPECT_EQ(200, response.status);
    for (const char *name : {"hello.txt", "page.html", "sub"})
      EXPECT_THAT(BodyOf(response), HasSubstr(name));
    EXPECT_EQ("folder", browser().note().route);
  }
}

TEST_F(SiteContent, AFolderBelowIsListed) {
  for (const char *below : {"/sub", "/sub/"}) {
    Response response = Get(below);
    EXPECT_THAT(BodyOf(response), HasSubstr("inner.txt"));
    EXPECT_THAT(BodyOf(response), Not(HasSubstr("hello.txt")));
  }
}

TEST_F(SiteContent, AFolderIsSortedAsAskedFor) {
  velk_test::WriteFile(Shared("a.bin"), std::string(9000, 'x'));
  Response by_name = Get("");
  const std::string names = BodyOf(by_name);
  EXPECT_LT(names.find("a.bin"), names.find("hello.txt"));
  Response by_size = Get("?sort=size&order=asc");
  const std::string sizes = BodyOf(by_size);
  EXPECT_GT(sizes.find("a.bin"), sizes.find("hello.txt"));
  EXPECT_EQ(200, Get("?sort=nonsense&order=up").status);
}

TEST_F(SiteContent, AFileHasAPage) {
  Response response = Get("/hello.txt");
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("Hello, visitor"));
  EXPECT_THAT(std::string(response.headers.Get("Content-Type")), StartsWith("text/html"));
  EXPECT_EQ("file", browser().note().route);
}

TEST_F(SiteContent, APageLeadsToTheNextFile) {
  Response response = Get("/hello.txt");
  EXPECT_THAT(BodyOf(response), HasSubstr("rel=\"next\""));
}

TEST_F(SiteContent, AFileIsDownloaded) {
  Response response = Get("/hello.txt?download");
  EXPECT_EQ(200, response.status);
  EXPECT_EQ("Hello, visitor\n", BodyOf(response));
  EXPECT_THAT(std::string(response.headers.Get("Content-Disposition")), StartsWith("attachment"));
  EXPECT_EQ("nosniff", response.headers.Get("X-Content-Type-Options"));
  EXPECT_THAT(std::string(response.headers.Get("Cache-Control")), StartsWith("private"));
  EXPECT_EQ("download", browser().note().route);
}

TEST_F(SiteContent, ANameMayBeOdd) {
  Response response = Get("/odd%20name%20%C3%A4.txt?download");
  EXPECT_EQ("odd\n", BodyOf(response));
}

TEST_F(SiteContent, APartOfAFileIsDownloaded) {
  Response response = Get("/hello.txt?download", {{"Range", "bytes=0-4"}});
  EXPECT_EQ(206, response.status);
  EXPECT_EQ("Hello", BodyOf(response));
}

TEST_F(SiteContent, AFileThatIsKnownIsNotSentAgain) {
  Response first = Get("/hello.txt?download");
  Response second =
      Get("/hello.txt?download", {{"If-None-Match", std::string(first.headers.Get("ETag"))}});
  EXPECT_EQ(304, second.status);
}

TEST_F(SiteContent, AFileIsViewed) {
  Response response = Get("/hello.txt?view");
  EXPECT_THAT(std::string(response.headers.Get("Content-Disposition")), StartsWith("inline"));
  EXPECT_EQ("view", browser().note().route);
}

TEST_F(SiteContent, WhatABrowserCouldExecuteIsSavedInstead) {
  Response response = Get("/page.html?view");
  EXPECT_THAT(std::string(response.headers.Get("Content-Disposition")), StartsWith("attachment"));
  EXPECT_THAT(std::string(response.headers.Get("Content-Security-Policy")), HasSubstr("sandbox"));
}

TEST_F(SiteContent, APageQuotesMarkup) {
  Response response = Get("/page.html");
  EXPECT_THAT(BodyOf(response), Not(HasSubstr("<script>alert")));
}

TEST_F(SiteContent, AFolderIsPackedAsAsked) {
  Response whole = Get("?zip");
  EXPECT_EQ(200, whole.status);
  const std::string bytes = BodyOf(whole);
  EXPECT_THAT(bytes, StartsWith("PK"));
  EXPECT_THAT(bytes, HasSubstr("hello.txt"));
  EXPECT_EQ("zip", browser().note().route);
  Response selection = Get("?zip=&name=sub");
  const std::string part = BodyOf(selection);
  EXPECT_THAT(part, HasSubstr("inner.txt"));
  EXPECT_THAT(part, Not(HasSubstr("hello.txt")));
}

TEST_F(SiteContent, AZipOfWhatIsNotThereIsNotThere) {
  for (const char *query : {"?zip&name=none", "?zip&name=..", "?zip&name=../outside.txt",
                            "?zip&name=%2fetc%2fpasswd", "?zip&name="})
    EXPECT_EQ(404, Get(query).status) << query;
}

TEST_F(SiteContent, WhatIsNotThereIsNotThere) {
  for (const char *below : {"/none", "/none/", "/hello.txt/", "/hello.txt/x", "/sub/none",
                            "/hello.txt?thumbnail", "/sub/hello.txt"})
    EXPECT_EQ(404, Get(below).status) << below;
}

TEST_F(SiteContent, AQueryThatIsBrokenIsRefused) {
  EXPECT_EQ(400, Get("?zip&name=%zz").status);
  EXPECT_EQ(400, Get("/hello.txt?download=%00").status);
}

TEST_F(SiteContent, ALinkToAFileShowsThatFile) {
  Store(LinkTo("single", Shared("hello.txt")));
  Response page = browser().Get("/sharing/single");
  EXPECT_THAT(BodyOf(page), HasSubstr("Hello, visitor"));
  Response file = browser().Get("/sharing/single?download");
  EXPECT_EQ("Hello, visitor\n", BodyOf(file));
  EXPECT_EQ(404, browser().Get("/sharing/single/x").status);
}

TEST_F(SiteContent, AHeadHasTheHeadOfTheGet) {
  Get("");
  for (const char *below : {"", "/hello.txt"})
    EXPECT_EQ(HeadOf(Get(below)), HeadOf(browser().Head("/sharing/abc" + std::string(below))));
}

class SiteHideDownload : public SiteContent {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (IsSkipped()) return;
    Entry entry = FolderLink("abc");
    Json::Value app = entry.get_app();
    app["hide_download"] = true;
    entry.set_app(app);
    Store(entry);
    velk_test::WriteFile(Shared("paper.pdf"), "%PDF-1.4\n%%EOF\n");
  }
};

TEST_F(SiteHideDownload, NothingIsDownloaded) {
  Get("");
  for (const char *below : {"/hello.txt?download", "?zip", "/sub?zip", "?zip&name=sub",
                            "/page.html?view", "/hello.txt?view", "/paper.pdf?download&view"})
    EXPECT_EQ(404, Get(below).status) << below;
}

TEST_F(SiteHideDownload, PreviewsAreShown) {
  Response page = Get("/hello.txt");
  EXPECT_THAT(BodyOf(page), HasSubstr("Hello, visitor"));
  EXPECT_THAT(BodyOf(page), Not(HasSubstr("?download")));
  EXPECT_EQ(200, Get("/paper.pdf?view").status);
}

TEST_F(SiteHideDownload, AFolderOffersNoDownloads) {
  Response page = Get("");
  EXPECT_THAT(BodyOf(page), HasSubstr("hello.txt"));
  EXPECT_THAT(BodyOf(page), Not(HasSubstr("zip")));
}

}  // namespace
