// Spellings of ways out of what is shared.
#include <set>

#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::LogCapture;
using web::Response;

/// Spellings of "..".
const std::vector<std::string> kDots = {
    "..",
    "%2e%2e",
    "%2E%2E",
    ".%2e",
    "%2e.",
    "%252e%252e",
    "%25252e%25252e",
    "%c0%ae%c0%ae",
    "%e0%80%ae%e0%80%ae",
    "%f0%80%80%ae%f0%80%80%ae",
    "%c0%2e%c0%2e",
    "%ef%bc%8e%ef%bc%8e",
    "%e2%80%a5",
    "%u002e%u002e",
    "..%00",
    "..%20",
    "..%09",
    "..;",
    "...",
    "....",
    ".. ",
    "..%0d%0a",
    "%00..",
    "..%01",
};

/// Spellings of "/".
const std::vector<std::string> kSlashes = {
    "/",  "%2f", "%2F",   "%252f",  "%25252f",   "%5c",    "%5C",       "%255c",  "\\",
    "//", "/./", "/%2e/", "%c0%af", "%e0%80%af", "%c1%9c", "%ef%bc%8f", "%u2215", "%00/",
};

/// Ways out, below a link. More than 300.
std::vector<std::string> WaysOut() {
  std::vector<std::string> ways;
  for (const std::string &dots : kDots) {
    for (const std::string &slash : kSlashes) {
      ways.push_back("/" + dots + slash + "outside.txt");
      ways.push_back("/sub/" + dots + slash + dots + slash + "outside.txt");
    }
    ways.push_back("/hello.txt/" + dots + "/" + dots + "/outside.txt");
  }
  for (const std::string &slash : kSlashes) {
    ways.push_back("/" + slash + "etc/passwd");
    ways.push_back(slash + slash + "etc" + slash + "passwd");
  }
  for (const char *other : {"/outside.txt",
                            "/sub/%2e%2e/%2e%2e/outside.txt",
                            "/file:///etc/passwd",
                            "/~root/x",
                            "/proc/self/environ",
                            "/%2fproc%2fself%2froot%2fetc%2fpasswd",
                            "/out",
                            "/out/passwd",
                            "/C:%5cWindows",
                            "/%3f/../outside.txt",
                            "/hello.txt%00.png",
                            "/hello.txt%00",
                            "/%00hello.txt",
                            "/hello.txt%2f",
                            "/hello.txt%2f..%2f..%2foutside.txt",
                            "/sub%2finner.txt",
                            "/sub%5cinner.txt",
                            "/./hello.txt",
                            "/%2e/hello.txt",
                            "/sub/../hello.txt",
                            "//hello.txt",
                            "/hello.txt%",
                            "/%2",
                            "/hello.txt%zz",
                            "/.",
                            "/..",
                            "/.hidden",
                            "/%2ehidden"})
    ways.push_back(other);
  return ways;
}

class SiteTraversal : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (IsSkipped()) return;
    ASSERT_EQ(0, symlink("/etc", Shared("out").c_str()));
    velk_test::WriteFile(Shared(".hidden"), "hidden\n");
    StoreOpen("abc");
  }
};

TEST_F(SiteTraversal, NoSpellingLeadsOutOfWhatIsShared) {
  const std::vector<std::string> ways = WaysOut();
  ASSERT_LE(300u, std::set<std::string>(ways.begin(), ways.end()).size());
  const LogCapture quiet;
  Browser browser(site());
  ASSERT_EQ(200, browser.Get("/sharing/abc").status);
  for (const std::string &way : ways) {
    for (const char *query : {"", "?download"}) {
      Response response = browser.Get("/sharing/abc" + way + query);
      EXPECT_EQ(404, response.status) << way;
      EXPECT_THAT(BodyOf(response), Not(HasSubstr("outside of what"))) << way;
    }
  }
}

TEST_F(SiteTraversal, NoSpellingLeadsFromOneLinkToAnother) {
  StoreWithPassword("other");
  const LogCapture quiet;
  Browser browser(site());
  browser.Get("/sharing/abc");
  for (const std::string &dots : kDots) {
    for (const std::string &slash : kSlashes) {
      Response response = browser.Get("/sharing/abc/" + dots + slash + "other");
      EXPECT_EQ(404, response.status) << dots << slash;
    }
  }
}

TEST_F(SiteTraversal, NoSpellingSelectsForAnArchive) {
  const LogCapture quiet;
  Browser browser(site());
  browser.Get("/sharing/abc");
  for (const std::string &dots : kDots) {
    for (const std::string &slash : kSlashes) {
      Response response = browser.Get("/sharing/abc?zip&name=" + dots + slash + "outside.txt");
      EXPECT_THAT(response.status, testing::AnyOf(404, 400)) << dots << slash;
    }
  }
}

}  // namespace
