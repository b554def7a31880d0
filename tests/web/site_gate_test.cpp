// Web servers that ask whether a visitor may see something of theirs, and the way through a login.
#include <velksharing/database.h>
#include <velksharing/store.h>

#include "site_support.h"
#include "support/log_capture.h"
#include "support/raw_database.h"
#include "support/velk_root.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::UnorderedElementsAre;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::HeadOf;
using velk_test::LogCapture;
using velk_test::SiteTest;
using web::Response;

const char *const kWiki = "https://wiki.example/page?id=7";
const velk_test::HeaderList kOnWiki = {{"Host", "wiki.example"}};

class SiteGate : public SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (!IsSkipped()) OpenGate({});
  }

  void OpenGate(std::vector<web::gate::GuardedPrefix> guarded) {
    web::SiteSettings settings;
    settings.runtime_folder = runtime_.path();
    settings.form_secret = "0123456789abcdef0123456789abcdef";
    settings.has_gate = true;
    settings.guarded = std::move(guarded);
    site_ = std::make_unique<web::Site>(settings);
  }

  /// A link that shares nothing, but says that it guards these.
  static Entry Guarding(const std::string &hash, const std::vector<std::string> &prefixes) {
    Json::Value app(Json::objectValue);
    app["protects"] = Json::Value(Json::arrayValue);
    for (const std::string &prefix : prefixes) app["protects"].append(prefix);
    Entry entry = velk_test::LinkToNothing(hash);
    entry.set_app(app);
    return entry;
  }

  static Entry Guarded(const std::string &hash, const std::vector<std::string> &prefixes) {
    return WithPassword(Guarding(hash, prefixes));
  }

  static Entry Load(const std::string &hash) {
    Entry entry;
    EXPECT_TRUE(EntryDB(SharingDB::Instance()).GetByHash(hash, entry));
    return entry;
  }

  static void Update(const Entry &entry) {
    ASSERT_TRUE(EntryDB(SharingDB::Instance()).Update(entry));
  }

  /// A visitor of wiki.example by https.
  Browser Visitor() {
    Browser browser(site());
    browser.UseHttps();
    return browser;
  }

  static Response LogIn(Browser &browser, const std::string &target) {
    return browser.Submit(target, {{"password", "secret"}}, kOnWiki);
  }

  static std::string LoginOf(const Response &response) {
    return std::string(response.headers.Get("X-Velk-Sharing-Login"));
  }
};

TEST_F(SiteGate, AStrangerIsShownTheWayToTheLogin) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  Response response = browser.Ask(kWiki);
  EXPECT_EQ(401, response.status);
  EXPECT_EQ("/sharing/abc?return=%2Fpage%3Fid%3D7", LoginOf(response));
  EXPECT_THAT(BodyOf(response),
              HasSubstr("http-equiv=\"refresh\" content=\"0; url=/sharing/abc?return="));
  EXPECT_EQ("auth", browser.note().route);
}

TEST_F(SiteGate, AVisitorLogsInAndComesBackToThePageFirstAskedFor) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  const Response in = LogIn(browser, LoginOf(browser.Ask(kWiki)));
  EXPECT_EQ(303, in.status);
  EXPECT_EQ("/page?id=7", in.headers.Get("Location"));
  const Response response = browser.Ask(kWiki);
  EXPECT_EQ(204, response.status);
  EXPECT_EQ("abc", response.headers.Get("X-Velk-Sharing-Hash"));
  EXPECT_EQ(nullptr, response.headers.Find("X-Velk-Sharing-Uid"));
  EXPECT_EQ("no-store", response.headers.Get("Cache-Control"));
}

TEST_F(SiteGate, AWrongPasswordAsksAgainForTheSamePage) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  Response response =
      browser.Submit("/sharing/abc?return=%2Fpage", {{"password", "wrong"}}, kOnWiki);
  EXPECT_EQ(401, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("action=\"/sharing/abc?return=%2Fpage\""));
  EXPECT_EQ(401, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, TheAnswerTellsHowLongTheGrantLasts) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const long remaining =
      std::stol(std::string(browser.Ask(kWiki).headers.Get("X-Velk-Sharing-Remaining")));
  EXPECT_GT(remaining, 86390);
  EXPECT_LE(remaining, 86400);
}

TEST_F(SiteGate, AGrantDoesNotOutlastItsLink) {
  Store(Guarded("abc", {"https://wiki.example/"}).set_expire_at(time(nullptr) + 100));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const long remaining =
      std::stol(std::string(browser.Ask(kWiki).headers.Get("X-Velk-Sharing-Remaining")));
  EXPECT_GT(remaining, 90);
  EXPECT_LE(remaining, 100);
}

TEST_F(SiteGate, AnAuthorizerGets200AndVariables) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  Response response = browser.AskAsAuthorizer(kWiki);
  EXPECT_EQ(200, response.status);
  EXPECT_EQ("", BodyOf(response));
  EXPECT_EQ("abc", response.headers.Get("Variable-VELK_SHARING_HASH"));
}

TEST_F(SiteGate, ACheckCostsNoUse) {
  Store(Guarded("abc", {"https://wiki.example/"}).set_expire_times(2));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  for (int check = 0; check < 5; ++check) EXPECT_EQ(204, browser.Ask(kWiki).status);
  EXPECT_EQ("1", Value("SELECT use_count FROM entry"));
}

TEST_F(SiteGate, WhatNoLinkGuardsIsClosed) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  for (const char *address : {"http://wiki.example/page", "https://other.example/page",
                              "https://wiki.example:8443/page", "https://wiki.example.evil/"}) {
    Response response = browser.Ask(address);
    EXPECT_EQ(403, response.status) << address;
    EXPECT_EQ("", LoginOf(response)) << address;
  }
}

TEST_F(SiteGate, WhatIsNotClearlyAnAddressIsClosed) {
  Store(Guarded("abc", {"https://wiki.example/", "/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask("https://wiki.example/").status);
  for (const char *address :
       {"", "/", "/page", "//wiki.example/", "wiki.example/", "ftp://wiki.example/",
        "https://wiki.example/%zz", "https://wiki.example/%00", "https://user@wiki.example/",
        "https://wiki.example/#a", "https:///", "https://wiki.example/a b",
        "https://wiki.example?/"})
    EXPECT_EQ(403, browser.Ask(address).status) << address;
}

TEST_F(SiteGate, WithoutAGateNobodyIsLetIn) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const std::string session = browser.CookieFor("/page", "sharing_sid_abc");
  SiteTest::SetUp();
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser later(site());
  later.SetCookie("/", "sharing_sid_abc", session);
  EXPECT_EQ(403, later.Ask(kWiki).status);
  EXPECT_EQ(404, later.Get("/sharing/abc").status);
}

TEST_F(SiteGate, OneLinksVisitorIsAnothersStranger) {
  Store(Guarded("abc", {"/public"}));
  Store(Guarded("def", {"/private"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask("https://wiki.example/public/a").status);
  EXPECT_EQ(401, browser.Ask("https://wiki.example/private/a").status);
  // Nor by another cookie's name.
  browser.SetCookie("/", "sharing_sid_def", browser.CookieFor("/public", "sharing_sid_abc"));
  EXPECT_EQ(401, browser.Ask("https://wiki.example/private/a").status);
}

TEST_F(SiteGate, TheLongestPrefixWins) {
  Store(Guarded("abc", {"/"}));
  Store(Guarded("def", {"/private"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask("https://wiki.example/private-not").status);
  for (const char *address :
       {"https://wiki.example/private", "https://wiki.example/private/a",
        "https://wiki.example//private/a", "https://wiki.example/x/..%2fprivate/a",
        "https://wiki.example/%70rivate/a", "https://wiki.example/./private"})
    EXPECT_NE(204, browser.Ask(address).status) << address;
}

TEST_F(SiteGate, EitherOfTwoLinksLetsIn) {
  Store(Guarded("abc", {"/wiki"}));
  Store(Guarded("def", {"/wiki/"}));
  for (const char *hash : {"abc", "def"}) {
    Browser browser = Visitor();
    LogIn(browser, std::string("/sharing/") + hash);
    const Response response = browser.Ask("https://wiki.example/wiki/a");
    EXPECT_EQ(204, response.status);
    EXPECT_EQ(hash, response.headers.Get("X-Velk-Sharing-Hash"));
  }
}

TEST_F(SiteGate, TheConfigurationPutsAPrefixBehindALink) {
  OpenGate({{*web::gate::Prefix::Parse("https://wiki.example/"), "abc"}});
  Store(WithPassword(velk_test::LinkToNothing("abc")));
  Browser browser = Visitor();
  const Response in = LogIn(browser, LoginOf(browser.Ask(kWiki)));
  EXPECT_EQ("/page?id=7", in.headers.Get("Location"));
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, AHashThatTheConfigurationNamesInVainLetsNobodyIn) {
  OpenGate({{*web::gate::Prefix::Parse("/"), "nosuch"}});
  EXPECT_EQ(403, Visitor().Ask(kWiki).status);
}

TEST_F(SiteGate, ALinkThatIsDisabledLetsNobodyInFromTheNextRequestOn) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask(kWiki).status);
  Update(Load("abc").set_enabled(false));
  EXPECT_EQ(403, browser.Ask(kWiki).status);
  Update(Load("abc").set_enabled(true));
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, ALinkThatIsDeletedLetsNobodyInFromTheNextRequestOn) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask(kWiki).status);
  ASSERT_TRUE(EntryDB(SharingDB::Instance()).Delete(Load("abc")));
  EXPECT_EQ(403, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, WhatALinkBeginsToGuardItGuardsWithTheNextRequest) {
  Store(Guarded("abc", {"/"}));
  Store(WithPassword(FolderLink("def")));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask("https://wiki.example/private/a").status);
  Entry other = Load("def");
  Json::Value app = other.get_app();
  app["protects"].append("/private");
  Update(other.set_app(app));
  EXPECT_EQ(401, browser.Ask("https://wiki.example/private/a").status);
  app["protects"][0] = "/elsewhere";
  Update(other.set_app(app));
  EXPECT_EQ(204, browser.Ask("https://wiki.example/private/a").status);
}

TEST_F(SiteGate, WhatOtherProgramsChangeCountsFromTheNextRequestOn) {
  Store(Guarded("abc", {"/"}));
  Store(Guarded("def", {"/private"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  velk_test::RawDatabase others(velk_test::SharingDatabasePath());
  for (int turn = 0; turn < 3; ++turn) {
    EXPECT_EQ(401, browser.Ask("https://wiki.example/private/a").status);
    others.Run("UPDATE entry SET data = replace(data, '/private', '/secret') WHERE hash = 'def'");
    EXPECT_EQ(204, browser.Ask("https://wiki.example/private/a").status);
    EXPECT_EQ(401, browser.Ask("https://wiki.example/secret/a").status);
    others.Run("UPDATE entry SET data = replace(data, '/secret', '/private') WHERE hash = 'def'");
  }
  others.Run("DELETE FROM entry WHERE hash = 'abc'");
  EXPECT_EQ(403, browser.Ask("https://wiki.example/a").status);
}

TEST_F(SiteGate, LoggingOutEndsIt) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const std::string session = browser.CookieFor("/page", "sharing_sid_abc");
  browser.Post("/sharing/abc/logout", {}, {{"X-Velk-Sharing", session}, kOnWiki[0]});
  EXPECT_EQ("", browser.CookieFor("/page", "sharing_sid_abc"));
  browser.SetCookie("/", "sharing_sid_abc", session);
  EXPECT_EQ(401, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, AnOpenLinksHashIsNotTold) {
  Store(Guarding("abc", {"https://wiki.example/"}));
  Response response = Visitor().Ask(kWiki);
  EXPECT_EQ(403, response.status);
  EXPECT_THAT(HeadOf(response) + BodyOf(response), Not(HasSubstr("abc")));
}

TEST_F(SiteGate, WhoOpensAnOpenLinkIsLedToWhatItGuards) {
  Store(Guarding("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  const Response response = browser.Get("/sharing/abc", kOnWiki);
  EXPECT_EQ(303, response.status);
  EXPECT_EQ("/", response.headers.Get("Location"));
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, ALinkThatSharesFilesAsWellShowsThem) {
  Entry entry = WithPassword(FolderLink("abc"));
  Json::Value app = entry.get_app();
  app["protects"].append("/wiki");
  Store(entry.set_app(app));
  Browser browser = Visitor();
  EXPECT_EQ("/sharing/abc", LogIn(browser, "/sharing/abc").headers.Get("Location"));
  Response page = browser.Get("/sharing/abc", kOnWiki);
  EXPECT_THAT(BodyOf(page), HasSubstr("hello.txt"));
  EXPECT_EQ(204, browser.Ask("https://wiki.example/wiki").status);
}

TEST_F(SiteGate, TheCookieGoesToWhatIsGuardedHereAndNowhereElse) {
  Store(Guarded("abc", {"https://wiki.example/a/b", "/a/c", "https://other.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_NE("", browser.CookieFor("/a/b", "sharing_sid_abc"));
  EXPECT_EQ("", browser.CookieFor("/b", "sharing_sid_abc"));
}

TEST_F(SiteGate, WhoIsInAlreadyIsSentBackWithoutALogin) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  browser.SetCookie("/", "sharing_sid_abc", "lost");
  const std::string login = LoginOf(browser.Ask(kWiki));
  const Response response = browser.Get(login, kOnWiki);
  EXPECT_EQ("/page?id=7", response.headers.Get("Location"));
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, AStaleCookieBesideTheRightOneDoesNoHarm) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  browser.SetCookie("/page", "sharing_sid_abc", "stale");
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, ProgramsSendTheirSessionInAHeaderField) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const std::string session = browser.CookieFor("/page", "sharing_sid_abc");
  Browser program(site());
  EXPECT_EQ(204, program.Ask(kWiki, {{"X-Velk-Sharing", session}}).status);
  Response response = program.Ask(kWiki, {{"Accept", "application/json"}});
  EXPECT_EQ(401, response.status);
  EXPECT_EQ("UNAUTHORIZED", velk_test::JsonOf(response)["name"]);
  EXPECT_EQ("/sharing/abc?return=%2Fpage%3Fid%3D7", LoginOf(response));
}

TEST_F(SiteGate, NobodyIsLedOffTheSiteOrOutOfThePrefix) {
  Store(Guarded("abc", {"https://wiki.example/wiki", "/here"}));
  for (const char *target :
       {"https://evil.example/", "//evil.example/", "/%5Cevil.example", "/\\evil.example", "evil",
        "/other", "/wikipedia", "/wiki/..%2f..%2fother", "javascript:alert(1)", "/wiki\r\nX: y",
        "/wiki#a", "", "/here%00"}) {
    Browser browser = Visitor();
    const std::string login = "/sharing/abc?" + velk_test::Encoded({{"return", target}});
    Response page = browser.Get(login, kOnWiki);
    EXPECT_THAT(BodyOf(page), Not(HasSubstr("return="))) << target;
    EXPECT_EQ("/wiki/", LogIn(browser, login).headers.Get("Location")) << target;
  }
}

TEST_F(SiteGate, APageThatOnlyAnotherSiteGuardsIsNotReturnedToHere) {
  Store(Guarded("abc", {"https://other.example/", "/here"}));
  Browser browser = Visitor();
  EXPECT_EQ("/here/", LogIn(browser, "/sharing/abc?return=%2Fanywhere").headers.Get("Location"));
}

TEST_F(SiteGate, WhoIsInCanLogOutOfALinkThatOnlyGuards) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  ASSERT_EQ(204, browser.Ask(kWiki).status);
  const Response left = browser.Submit("/sharing/abc/logout", velk_test::FieldList{}, kOnWiki);
  EXPECT_EQ("/sharing/abc?logged-out", left.headers.Get("Location"));
  EXPECT_EQ(401, browser.Ask(kWiki).status);
  Response page = browser.Get("/sharing/abc?logged-out", kOnWiki);
  EXPECT_THAT(BodyOf(page), HasSubstr("You have logged out"));
}

TEST_F(SiteGate, LookingAtThePageToLogOutDoesNotLogOut) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  Response page = browser.Get("/sharing/abc/logout", kOnWiki);
  EXPECT_EQ(200, page.status);
  EXPECT_THAT(BodyOf(page), HasSubstr("You are logged in"));
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, AStrangerAtThePageToLogOutIsAskedForThePassword) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  Response page = browser.Get("/sharing/abc/logout", kOnWiki);
  EXPECT_THAT(BodyOf(page), HasSubstr("type=\"password\""));
}

TEST_F(SiteGate, ASessionIsEnoughToLogOutWith) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  Browser other = Visitor();
  other.SetCookie("/sharing/abc", "sharing_sid", browser.CookieFor("/sharing/abc", "sharing_sid"));
  EXPECT_EQ(303, other.Submit("/sharing/abc/logout", velk_test::FieldList{}, kOnWiki).status);
  EXPECT_EQ(401, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, AnOpenLinkHasNothingToLogOutOf) {
  Store(Guarding("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  EXPECT_EQ("/", browser.Get("/sharing/abc/logout", kOnWiki).headers.Get("Location"));
}

TEST_F(SiteGate, ProgramsGetNoPageToLogOut) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  const velk_test::HeaderList program = {{"Host", "wiki.example"}, {"Accept", "application/json"}};
  Response response = browser.Get("/sharing/abc/logout", program);
  EXPECT_EQ("/", velk_test::JsonOf(response)["redirect"]);
}

TEST_F(SiteGate, ALinkThatAlsoSharesShowsAFileNamedLikeThePageToLogOut) {
  Entry entry = WithPassword(FolderLink("abc"));
  Json::Value app = entry.get_app();
  app["protects"][0] = "https://wiki.example/wiki";
  Store(entry.set_app(app));
  velk_test::WriteFile(Shared("logout"), "a file");
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  Response file = browser.Get("/sharing/abc/logout?view", kOnWiki);
  EXPECT_EQ("a file", BodyOf(file));
}

TEST_F(SiteGate, AnotherSitesVisitorIsLedThereByAPage) {
  Store(Guarded("abc", {"https://other.example/"}));
  Browser browser = Visitor();
  Response response = LogIn(browser, "/sharing/abc");
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("https://other.example/"));
}

TEST_F(SiteGate, WhatIsNoPrefixIsIgnoredAndLogged) {
  Entry entry = Guarded("abc", {"https://wiki.example/", "wiki", "/a?b", "/a/../b", ""});
  Json::Value app = entry.get_app();
  app["protects"].append(7);
  app["protects"].append(Json::nullValue);
  Store(entry.set_app(app));
  Browser browser = Visitor();
  LogCapture log;
  EXPECT_EQ(401, browser.Ask(kWiki).status);
  EXPECT_THAT(log.Texts(), testing::Contains(HasSubstr("no prefix of addresses")));
}

TEST_F(SiteGate, ProtectsThatIsNoListGuardsNothing) {
  Json::Value object(Json::objectValue);
  object["a"] = "/";
  for (const Json::Value &value : {Json::Value("/"), object, Json::Value(true), Json::Value()}) {
    RunSql("DELETE FROM entry");
    Entry entry = WithPassword(velk_test::LinkToNothing("abc"));
    Json::Value app(Json::objectValue);
    app["protects"] = value;
    Store(entry.set_app(app));
    EXPECT_EQ(403, Visitor().Ask(kWiki).status) << value.toStyledString();
  }
}

TEST_F(SiteGate, ALinkThatCannotBeUsedStillGuards) {
  Store(Guarded("abc", {"/"}));
  Store(Guarded("def", {"/private"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  RunSql("UPDATE entry SET data = json_set(data, '$.protect_type', 7) WHERE hash = 'def'");
  const LogCapture quiet;
  EXPECT_EQ(403, browser.Ask("https://wiki.example/private/a").status);
  EXPECT_EQ(204, browser.Ask("https://wiki.example/a").status);
}

TEST_F(SiteGate, ALinkWhoseDataIsBrokenClosesEverything) {
  Store(Guarded("abc", {"/"}));
  Store(Guarded("def", {"/private"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  RunSql("UPDATE entry SET data = substr(data, 2) WHERE hash = 'def'");
  const LogCapture log;
  EXPECT_EQ(503, browser.Ask("https://wiki.example/a").status);
  EXPECT_THAT(log.Texts(), testing::Contains(HasSubstr("its data cannot be read")));
  RunSql("DELETE FROM entry WHERE hash = 'def'");
  EXPECT_EQ(204, browser.Ask("https://wiki.example/a").status);
}

TEST_F(SiteGate, AnIndexThatIsGoneIsMadeAnew) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  EXPECT_EQ(401, Visitor().Ask(kWiki).status);
  velk_test::RawDatabase(velk_test::SharingDatabasePath()).Run("DROP INDEX entry_guards");
  EXPECT_EQ(401, Visitor().Ask(kWiki).status);
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM sqlite_master WHERE name = 'entry_guards'"));
}

TEST_F(SiteGate, ADatabaseThatCannotBeReadClosesIt) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  EXPECT_EQ(204, browser.Ask(kWiki).status);
  RunSql("ALTER TABLE entry RENAME TO entry_away");
  const Response response = browser.Ask(kWiki);
  RunSql("ALTER TABLE entry_away RENAME TO entry");
  EXPECT_EQ(503, response.status);
  EXPECT_EQ(204, browser.Ask(kWiki).status);
}

TEST_F(SiteGate, TheAnswerHoldsNoSecret) {
  Store(Guarded("abc", {"https://wiki.example/"}));
  Browser browser = Visitor();
  LogIn(browser, "/sharing/abc");
  Response response = browser.Ask(kWiki);
  const std::string session = browser.CookieFor("/page", "sharing_sid_abc");
  EXPECT_THAT(HeadOf(response) + BodyOf(response), Not(HasSubstr(session)));
}

}  // namespace
