// Links that let nobody in answer like links that do not exist.
#include <sys/stat.h>
#include <velksharing/constants.h>

#include <chrono>
#include <filesystem>
#include <functional>

#include "site_support.h"
#include "support/log_capture.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeaderList;
using velk_test::HeadOf;
using velk_test::LogCapture;
using web::Response;

constexpr unsigned int kNoAccount = 3999999999u;

class SiteHidden : public velk_test::SiteTest {
 protected:
  /// Stores a link for every reason to let nobody in.
  /// @return their hashes, that of no link first.
  std::vector<std::string> StoreHiddenLinks() {
    Entry disabled = FolderLink("disabled");
    disabled.set_enabled(false);
    Entry later = FolderLink("later");
    later.set_start_at(time(nullptr) + 3600);
    Entry expired = FolderLink("expired");
    expired.set_expire_at(time(nullptr) - 3600);
    Entry used_up = FolderLink("usedup");
    used_up.set_expire_times(2).set_use_count(2);
    Entry orphan = FolderLink("orphan");
    orphan.set_owner_uid(kNoAccount);
    Entry without_file = LinkTo("nofile", Shared("no such file"));
    Entry without_path = velk_test::LinkToNothing("nopath");
    for (const Entry &entry :
         {disabled, later, expired, used_up, orphan, without_file, without_path})
      Store(entry);
    StoreOpen("damaged");
    RunSql("UPDATE entry SET data = 'no JSON' WHERE hash = 'damaged'");
    return {"unknown", "disabled", "later",  "expired", "usedup",
            "orphan",  "nofile",   "nopath", "damaged"};
  }

  /// The whole answer to each link.
  std::vector<std::string> Answers(const std::function<Response(const std::string &)> &ask) {
    std::vector<std::string> answers;
    const LogCapture quiet;
    for (const std::string &hash : StoreHiddenLinks()) {
      Response response = ask("/sharing/" + hash);
      EXPECT_EQ(404, response.status) << hash;
      answers.push_back(HeadOf(response) + "\n" + BodyOf(response));
    }
    return answers;
  }

  static void ExpectAlike(const std::vector<std::string> &answers) {
    for (const std::string &answer : answers) EXPECT_EQ(answers.front(), answer);
  }
};

TEST_F(SiteHidden, LinksAreAlikeToALook) {
  ExpectAlike(Answers([this](const std::string &path) { return Browser(site()).Get(path); }));
}

TEST_F(SiteHidden, LinksAreAlikeToALookBelow) {
  ExpectAlike(
      Answers([this](const std::string &path) { return Browser(site()).Get(path + "/sub/?zip"); }));
}

TEST_F(SiteHidden, LinksAreAlikeToAHead) {
  ExpectAlike(Answers([this](const std::string &path) { return Browser(site()).Head(path); }));
}

TEST_F(SiteHidden, LinksAreAlikeToALogin) {
  ExpectAlike(Answers([this](const std::string &path) {
    return Browser(site()).Post(path, {{"password", "secret"}});
  }));
}

TEST_F(SiteHidden, LinksAreAlikeInJson) {
  const HeaderList json = {{"Accept", "application/json"}};
  ExpectAlike(Answers([&](const std::string &path) { return Browser(site()).Get(path, json); }));
}

TEST_F(SiteHidden, LinksAreAlikeToWhoBringsASession) {
  StoreOpen("open");
  Browser visitor(site());
  visitor.Get("/sharing/open");
  const std::string session = visitor.CookieFor("/sharing/open", "sharing_sid");
  ExpectAlike(Answers([&](const std::string &path) {
    Browser browser(site());
    browser.SetCookie(path, "sharing_sid", session);
    return browser.Get(path);
  }));
}

TEST_F(SiteHidden, LinksAreAlikeToWhoHasJustLeft) {
  ExpectAlike(Answers(
      [this](const std::string &path) { return Browser(site()).Get(path + "?logged-out"); }));
}

TEST_F(SiteHidden, LinksGiveNoCookie) {
  const LogCapture quiet;
  EXPECT_EQ(nullptr, Browser(site()).Get("/sharing/unknown").headers.Find("Set-Cookie"));
}

TEST_F(SiteHidden, LinksTakeTheSameTimeWhateverTheReason) {
  const LogCapture quiet;
  for (const std::string &hash : StoreHiddenLinks()) {
    const auto start = std::chrono::steady_clock::now();
    Browser(site()).Get("/sharing/" + hash);
    EXPECT_LE(std::chrono::milliseconds(2), std::chrono::steady_clock::now() - start) << hash;
  }
}

TEST_F(SiteHidden, WhatTheOwnerCannotReadIsHidden) {
  if (getuid() != 0) GTEST_SKIP() << "needs another account's file";
  const LogCapture quiet;
  velk_test::WriteFile(Shared("root.txt"), "root's\n");
  ASSERT_EQ(0, chmod(Shared("root.txt").c_str(), 0600));
  Store(LinkTo("unreadable", Shared("root.txt")));
  Response unreadable = Browser(site()).Get("/sharing/unreadable");
  Response unknown = Browser(site()).Get("/sharing/unknown");
  EXPECT_EQ(HeadOf(unknown) + BodyOf(unknown), HeadOf(unreadable) + BodyOf(unreadable));
}

TEST_F(SiteHidden, ALinkThatIsSwitchedOffIsHiddenFromWhoIsIn) {
  StoreOpen("abc");
  Browser browser(site());
  ASSERT_EQ(200, browser.Get("/sharing/abc").status);
  const LogCapture quiet;
  RunSql("UPDATE entry SET enabled = 0");
  EXPECT_EQ(404, browser.Get("/sharing/abc").status);
}

TEST_F(SiteHidden, WhoIsInStaysInWithTheLastUse) {
  Entry entry = WithPassword(FolderLink("abc"));
  entry.set_expire_times(1);
  Store(entry);
  Browser browser(site());
  ASSERT_EQ(303, browser.Submit("/sharing/abc", {{"password", "secret"}}).status);
  EXPECT_EQ(200, browser.Get("/sharing/abc").status);
  EXPECT_EQ(404, Browser(site()).Get("/sharing/abc").status);
}

TEST_F(SiteHidden, AddressesThatAreNoLinkAreHiddenToo) {
  for (const char *path : {"/", "", "/sharing", "/sharing/", "/other", "/sharing/a-b",
                           "/sharing/-/none.css", "*", "sharing", "/sharing/abc%zz"}) {
    Response response = Browser(site()).Get(path);
    EXPECT_EQ(404, response.status) << path;
  }
}

}  // namespace
