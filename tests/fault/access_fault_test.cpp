#include <gtest/gtest.h>
#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <new>
#include <sstream>

#include "fault/platform_override.h"
#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::Contains;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;
using VELK::sharing::UID_ERR;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
using velk_test::SampleEntry;
namespace real = velk_test::real;

constexpr long day = 86400;

/// A statement as its verb and table: "UPDATE session".
std::string Summary(const std::string &sql) {
  std::istringstream words(sql);
  std::string verb;
  std::string word;
  words >> verb >> word;
  if (verb == "SELECT" || verb == "INSERT" || verb == "DELETE")
    while (words >> word && (word == "FROM" || word == "INTO")) {
    }
  return verb + " " + word;
}

/// Visits with the platform's answers under control, over a database of their own: the sharing
/// database's path is redirected. Every call that matters is noted in order.
class AccessFault : public ::testing::Test {
 protected:
  void SetUp() override {
    RedirectTheDatabase();
    ASSERT_TRUE(db().IsGood());
    ASSERT_TRUE(db().Execute("DELETE FROM entry; DELETE FROM session; DELETE FROM token"));
    AnswerForTheRequest();
    AnswerForTheBlocking();
    AnswerForTheAccounts();
    WatchStatements();
  }

  static SharingDB &db() { return SharingDB::Instance(); }

  static std::string DatabasePath() {
    static const velk_test::TempDir folder;
    return folder.File("sharing.db");
  }

  /// The instance is made once, by the first test of the process.
  static void RedirectTheDatabase() {
    Overrides().file_exist = [](const char *) { return 1; };
    Overrides().db_connect = [](const char *host, const char *user, const char *password,
                                const char *) {
      velk_test::MakeSharingDatabase(DatabasePath());
      return real::DbConnect(host, user, password, DatabasePath().c_str());
    };
  }

  void AnswerForTheRequest() {
    Overrides().cgi_remote_ip = [this](char *out, size_t capacity) {
      EXPECT_EQ(65u, capacity);
      EXPECT_TRUE(std::all_of(out, out + capacity, [](char c) { return c == '\0'; }));
      calls_.push_back("remote ip");
      const std::string ip = ips_.empty() ? "192.0.2.1" : ips_.front();
      if (!ips_.empty()) ips_.erase(ips_.begin());
      if (ip.empty()) return -1;
      snprintf(out, capacity, "%s", ip.c_str());
      return 0;
    };
    Overrides().cgi_init = [this](VelkCgi **cgi, const char *reserved) {
      EXPECT_STREQ("", reserved);
      calls_.push_back("init");
      const int answer = real::CgiInit(cgi, reserved);
      return init_answer_ == 1 ? answer : init_answer_;
    };
    Overrides().cgi_load_in_cookies = [this](VelkCgi *cgi) {
      calls_.push_back("load cookies");
      return real::CgiLoadInCookies(cgi);
    };
    Overrides().cgi_param = [this](VelkCgi *, const char *name, const char *fallback) {
      calls_.push_back("param " + std::string(name));
      EXPECT_EQ(nullptr, fallback);
      return platform_session_;
    };
    Overrides().cgi_set_cookies = [this](VelkCgi *, const char *name, const char *value,
                                         long expires, const char *path, const char *domain,
                                         int secure) {
      calls_.push_back("set cookie " + std::string(name) + "=" + value + " " + path);
      EXPECT_EQ(0, expires);
      EXPECT_EQ(nullptr, domain);
      EXPECT_EQ(0, secure);
      return set_cookies_answer_;
    };
    Overrides().cgi_login = [this](VelkCgi *, char *name_out, size_t capacity,
                                   VelkCgiLoginRecord *record) {
      EXPECT_EQ(101u, capacity);
      EXPECT_TRUE(std::all_of(name_out, name_out + capacity, [](char c) { return c == '\0'; }));
      std::ostringstream call;
      call << "login " << record->name << " "
           << (record->password == nullptr ? "(null)" : record->password) << " " << record->client
           << " " << record->number1 << " " << record->number2;
      calls_.push_back(call.str());
      return login_answer_;
    };
    Overrides().cgi_free = [this](VelkCgi *cgi) {
      calls_.push_back("free cgi");
      real::CgiFree(cgi);
    };
  }

  void AnswerForTheBlocking() {
    Overrides().cgi_is_denied_ip = [this](const char *ip) {
      calls_.push_back("denied? " + std::string(ip));
      return denied_answer_;
    };
    Overrides().auto_block_fail = [this](const char *ip, const char *category) {
      calls_.push_back("count " + std::string(ip) + " " + category);
      return 0;
    };
    Overrides().auto_block_reset = [this](const char *ip) {
      calls_.push_back("forget " + std::string(ip));
      return 0;
    };
  }

  /// One account "ann", 1026, in the groups "people" (100) and "family" (101).
  void AnswerForTheAccounts() {
    Overrides().login_name_convert = [](const char *, char *, size_t) { return 0; };
    Overrides().real_name_get = [](const char *name, char *out, size_t capacity) {
      return snprintf(out, capacity, "%s", strcmp(name, "typed ann") == 0 ? "ann" : name);
    };
    Overrides().user_get = [this](const char *name, VELKUSER **user) {
      calls_.push_back("user " + std::string(name));
      return GiveAnn(strcmp(name, "ann") == 0, user);
    };
    Overrides().user_get_by_uid = [this](unsigned int uid, VELKUSER **user) {
      calls_.push_back("uid " + std::to_string(uid));
      return GiveAnn(uid == 1026, user);
    };
    Overrides().user_free = [this](VELKUSER *user) {
      if (user == &ann_) calls_.push_back("free user");
    };
    Overrides().group_info = [this](const char *, int, int) {
      calls_.push_back("groups");
      return has_groups_ ? real::GroupInfo("root", 1, 0) : nullptr;
    };
    Overrides().list_name = [](const VLIBCSzHash *, size_t index, int *end) {
      static const char *const names[] = {"people", "family"};
      if (end != nullptr) *end = index >= 2 ? 1 : 0;
      return index < 2 ? names[index] : nullptr;
    };
    Overrides().group_get_gid = [](const char *name, unsigned int *gid) {
      *gid = strcmp(name, "people") == 0 ? 100 : 101;
      return 0;
    };
  }

  int GiveAnn(bool found, VELKUSER **user) {
    *user = found && has_account_ ? &ann_ : nullptr;
    return *user != nullptr ? 0 : -1;
  }

  void WatchStatements() {
    Overrides().db_execute = [this](VELKDBHandle *handle, const char *sql, DBResult **result) {
      const std::string summary = Summary(sql);
      calls_.push_back(summary);
      statements_.push_back(sql);
      if (summary != failing_) return real::DbExecute(handle, sql, result);
      if (result != nullptr) *result = nullptr;
      return -1;
    };
  }

  static Entry Stored(Entry entry) {
    EXPECT_TRUE(EntryDB(db()).Create(entry)) << db().GetLastError();
    return entry;
  }

  static Entry UserLink() {
    return SampleEntry("h").set_protect_type(Entry::PROTECT_USER).set_protect_uids({1026});
  }

  /// Stores a link and a visitor who is logged in to it.
  int StoreVisitor(Entry link, long session_timeout, long token_timeout,
                   unsigned int uid = UID_ERR) {
    const Entry entry = Stored(std::move(link));
    RunRaw("INSERT INTO session VALUES (NULL, 's', " + std::to_string(uid) + ", '192.0.2.1', " +
           std::to_string(session_timeout) + ")");
    const std::string session = Value("SELECT MAX(id) FROM session");
    RunRaw("INSERT INTO token VALUES (NULL, " + std::to_string(entry.get_id()) + ", " + session +
           ", " + std::to_string(token_timeout) + ")");
    Forget();
    return entry.get_id();
  }

  int StoreVisitor(Entry link, unsigned int uid = UID_ERR) {
    const long later = real::Clock() + 3600;
    return StoreVisitor(std::move(link), later, later, uid);
  }

  int Login(bool keep_block_state = false) {
    return VELK::VelkSharingLogin(session_id_, &params_, keep_block_state);
  }

  int Authorized() { return VELK::VelkSharingIsAuthorized(&params_); }

  /// Forgets the calls noted so far.
  void Forget() {
    calls_.clear();
    statements_.clear();
  }

  /// The calls that have nothing to do with the database.
  std::vector<std::string> PlatformCalls() const {
    std::vector<std::string> calls;
    for (const std::string &call : calls_)
      if (call.find_first_of("SUID") != 0) calls.push_back(call);
    return calls;
  }

  long Count(const std::string &call) const {
    return std::count(calls_.begin(), calls_.end(), call);
  }

  static std::string Value(const std::string &sql) {
    return velk_test::RawDatabase(DatabasePath()).Value(sql);
  }

  static void RunRaw(const std::string &sql) { velk_test::RawDatabase(DatabasePath()).Run(sql); }

  static ::testing::Matcher<const velk_test::LogLine &> Said(const std::string &message) {
    return ErrorLine("%s:%d " + message, "sharinglogin:# " + message);
  }

  const OverrideScope scope_;
  _tag_sharing_login_params params_ = {"h", nullptr, nullptr, nullptr, "s"};
  std::string session_id_ = "before";
  std::vector<std::string> calls_;
  std::vector<std::string> statements_;

  std::vector<std::string> ips_;  ///< The next answers; "" fails; then the usual address.
  std::string failing_;           ///< The statements, by their summary, that fail.
  int denied_answer_ = 0;
  int init_answer_ = 1;
  int set_cookies_answer_ = 1;
  int login_answer_ = 1;
  const char *platform_session_ = nullptr;
  bool has_account_ = true;
  bool has_groups_ = true;
  std::string ann_name_ = "ann";
  VELKUSER ann_ = {ann_name_.data(), 1026};
};

// Login, step by step

TEST_F(AccessFault, LoginAsksAndWritesInItsOrder) {
  Stored(SampleEntry("h"));
  Forget();
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_THAT(calls_,
              ElementsAre("remote ip", "denied? 192.0.2.1", "SELECT entry", "SELECT entry",
                          "UPDATE entry", "remote ip", "SELECT session", "INSERT session",
                          "SELECT token", "INSERT token", "UPDATE session", "forget 192.0.2.1"));
}

TEST_F(AccessFault, LoginLooksForNoSessionWithoutAnIdentifier) {
  Stored(SampleEntry("h"));
  params_.session_id = nullptr;
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ(0, Count("SELECT session"));
}

TEST_F(AccessFault, LoginOfALiveSessionUpdatesSessionAndGrant) {
  StoreVisitor(SampleEntry("h"));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ("s", session_id_);
  EXPECT_THAT(calls_, ElementsAre("remote ip", "denied? 192.0.2.1", "SELECT entry", "SELECT entry",
                                  "UPDATE entry", "remote ip", "SELECT session", "SELECT token",
                                  "UPDATE token", "UPDATE session", "forget 192.0.2.1"));
}

TEST_F(AccessFault, LoginOpensNoTransaction) {
  StoreVisitor(SampleEntry("h"));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  EXPECT_EQ(1, VELK::VelkSharingLogout("h", "s"));
  EXPECT_THAT(statements_, Each(Not(StartsWith("BEGIN"))));
  EXPECT_THAT(statements_, Each(Not(StartsWith("COMMIT"))));
}

TEST_F(AccessFault, LoginStopsWithoutAnAddress) {
  Stored(SampleEntry("h"));
  Forget();
  ips_ = {""};
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_THAT(calls_, ElementsAre("remote ip"));
}

TEST_F(AccessFault, LoginStopsForABlockedAddress) {
  Stored(SampleEntry("h"));
  Forget();
  denied_answer_ = 1;
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_LOGIN_BLOCKED, Login());
  EXPECT_THAT(calls_, ElementsAre("remote ip", "denied? 192.0.2.1"));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d VelkAutoBlockIsDeniedIP %s",
                                                 "sharinglogin:# VelkAutoBlockIsDeniedIP "
                                                 "192.0.2.1")));
}

TEST_F(AccessFault, LoginTakesOnlyOneAsBlocked) {
  Stored(SampleEntry("h"));
  for (const int answer : {-1, 0, 2}) {
    denied_answer_ = answer;
    EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login()) << answer;
  }
}

TEST_F(AccessFault, LoginIsRefusedWhenTheLinkCannotBeRead) {
  Stored(SampleEntry("h"));
  Forget();
  failing_ = "SELECT entry";
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login());
  EXPECT_THAT(calls_, ElementsAre("remote ip", "denied? 192.0.2.1", "SELECT entry"));
}

TEST_F(AccessFault, LoginGoesOnWhenTheUseCannotBeCounted) {
  Stored(SampleEntry("h"));
  failing_ = "UPDATE entry";
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_THAT(log.lines(), Contains(Said("update entry use count fail")));
  EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
}

TEST_F(AccessFault, LoginThatLosesItsAddressHasUsedTheLink) {
  Stored(SampleEntry("h"));
  Forget();
  ips_ = {"192.0.2.1", ""};
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_EQ("before", session_id_);
  EXPECT_EQ("1", Value("SELECT use_count FROM entry"));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
  EXPECT_EQ("DELETE FROM token WHERE id=0", statements_.back());
  EXPECT_THAT(calls_, Not(Contains(StartsWith("forget"))));
  EXPECT_THAT(calls_, Not(Contains(StartsWith("count"))));
}

TEST_F(AccessFault, LoginKeepsTheSecondAddressAndForgetsTheFirst) {
  Stored(SampleEntry("h"));
  ips_ = {"192.0.2.1", "192.0.2.2"};
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ("192.0.2.2", Value("SELECT ip FROM session"));
  EXPECT_EQ("forget 192.0.2.1", calls_.back());
}

TEST_F(AccessFault, LoginIsUnusableWhenNoSessionCanBeStored) {
  Stored(SampleEntry("h"));
  Forget();
  failing_ = "INSERT session";
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_EQ(51, Count("INSERT session"));
  EXPECT_EQ("DELETE FROM token WHERE id=0", statements_.back());
  EXPECT_EQ("1", Value("SELECT use_count FROM entry"));
}

TEST_F(AccessFault, LoginIsUnusableWhenNoGrantCanBeStored) {
  Stored(SampleEntry("h"));
  failing_ = "INSERT token";
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_EQ("DELETE FROM token WHERE id=0", statements_.back());
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(AccessFault, LoginTakesAGrantAwayThatItCannotRenew) {
  StoreVisitor(SampleEntry("h"));
  failing_ = "UPDATE token";
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM token"));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(AccessFault, LoginTakesItsGrantAwayWhenTheSessionCannotBeWritten) {
  Stored(SampleEntry("h"));
  failing_ = "UPDATE session";
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login());
  EXPECT_EQ("before", session_id_);
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM token"));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
  EXPECT_THAT(calls_, Not(Contains(StartsWith("forget"))));
}

TEST_F(AccessFault, LoginKeepsTheBlockStateWhenAsked) {
  Stored(SampleEntry("h"));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login(true));
  EXPECT_THAT(calls_, Not(Contains(StartsWith("forget"))));
}

TEST_F(AccessFault, LoginCountsAWrongPasswordOnceWhateverIsAsked) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  Stored(entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT));
  for (const bool keep : {false, true}) {
    Forget();
    params_.password = "wrong";
    EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login(keep));
    EXPECT_EQ(1, Count("count 192.0.2.1 SHARING"));
    params_.password = nullptr;
    EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login(keep));
    EXPECT_EQ(2, Count("count 192.0.2.1 SHARING"));
  }
}

TEST_F(AccessFault, LoginSetsBothTimeOutsToADayFromNow) {
  StoreVisitor(SampleEntry("h"), 1700000100, 1700000100);
  Overrides().clock = [] { return time_t{1700000000}; };
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ(std::to_string(1700000000 + day), Value("SELECT timeout FROM session"));
  EXPECT_EQ(std::to_string(1700000000 + day), Value("SELECT timeout FROM token"));
}

// Login by account

class AccountLoginFault : public AccessFault {
 protected:
  void SetUp() override {
    AccessFault::SetUp();
    params_ = {"h", nullptr, "typed ann", "account secret", nullptr};
  }

  /// Logs in to a link and looks at how the refusal was booked.
  void ExpectRefused(int result, bool counted, bool keep_block_state = false) {
    Stored(UserLink());
    Forget();
    const LogCapture quiet;
    EXPECT_EQ(result, Login(keep_block_state));
    EXPECT_EQ(counted ? 1 : 0, Count("count 192.0.2.1 SHARING"));
    EXPECT_THAT(calls_, Not(Contains(StartsWith("forget"))));
    EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
    EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
    EXPECT_EQ(1, Count("free cgi"));
  }
};

TEST_F(AccountLoginFault, AsksThePlatformInItsOrder) {
  Stored(UserLink());
  Forget();
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_THAT(PlatformCalls(),
              ElementsAre("remote ip", "denied? 192.0.2.1", "init", "load cookies", "param _sid",
                          "login ann account secret webui 15 1", "user ann", "groups", ::testing::_,
                          ::testing::_, "remote ip", "forget 192.0.2.1"));
  EXPECT_EQ(1, Count("free cgi"));
  EXPECT_EQ(1, Count("free user"));
}

TEST_F(AccountLoginFault, RemembersTheAccountInTheSession) {
  Stored(UserLink());
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ("1026", Value("SELECT uid FROM session"));
}

TEST_F(AccountLoginFault, ReplacesTheAccountOfALiveSession) {
  StoreVisitor(UserLink(), 5u);
  params_.session_id = "s";
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ("1026", Value("SELECT uid FROM session"));
}

TEST_F(AccountLoginFault, KeepsTheAccountOfTheSessionOnOtherLinks) {
  StoreVisitor(SampleEntry("h"), 5u);
  params_.session_id = "s";
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ("5", Value("SELECT uid FROM session"));
  EXPECT_EQ(0, Count("init"));
}

TEST_F(AccountLoginFault, HandsThePlatformsSessionOn) {
  Stored(UserLink());
  platform_session_ = "platform-session";
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_EQ(1, Count("set cookie id=platform-session /"));
}

TEST_F(AccountLoginFault, HandsNoEmptyPlatformSessionOn) {
  Stored(UserLink());
  platform_session_ = "";
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
  EXPECT_THAT(calls_, Not(Contains(StartsWith("set cookie"))));
}

TEST_F(AccountLoginFault, HandsAMissingPasswordOn) {
  Stored(UserLink());
  params_.user_password = nullptr;
  login_answer_ = 0;
  EXPECT_EQ(VELK_SHARING_LOGIN_ACCOUNT_REFUSED, Login());
  EXPECT_EQ(1, Count("login ann (null) webui 15 1"));
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWithoutARequest) {
  init_answer_ = 0;
  Stored(UserLink());
  Forget();
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login());
  EXPECT_EQ(1, Count("count 192.0.2.1 SHARING"));
  EXPECT_EQ(0, Count("load cookies"));
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWhenTheCookieCannotBeSet) {
  platform_session_ = "platform-session";
  set_cookies_answer_ = 0;
  ExpectRefused(VELK_SHARING_LOGIN_REFUSED, true);
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWithTheWrongPassword) {
  for (const int answer : {0, -1, 2}) {
    login_answer_ = answer;
    ASSERT_TRUE(db().Execute("DELETE FROM entry"));
    ExpectRefused(VELK_SHARING_LOGIN_ACCOUNT_REFUSED, true);
  }
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWithTheWrongPasswordWhateverIsAsked) {
  login_answer_ = 0;
  ExpectRefused(VELK_SHARING_LOGIN_ACCOUNT_REFUSED, true, true);
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWhenTheAccountIsGone) {
  has_account_ = false;
  ExpectRefused(VELK_SHARING_LOGIN_REFUSED, true);
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWithoutTheGroups) {
  has_groups_ = false;
  ExpectRefused(VELK_SHARING_LOGIN_REFUSED, true);
  EXPECT_EQ(1, Count("free user"));
}

TEST_F(AccountLoginFault, IsRefusedAndCountedWithoutAName) {
  params_.username = nullptr;
  ExpectRefused(VELK_SHARING_LOGIN_REFUSED, true);
  EXPECT_EQ(1, Count("uid 4294967295"));
}

TEST_F(AccountLoginFault, IsNotPermittedAndCounted) {
  ann_.uid = 5;
  ExpectRefused(VELK_SHARING_LOGIN_NOT_PERMITTED, true);
  EXPECT_EQ(1, Count("free user"));
}

TEST_F(AccountLoginFault, IsNotPermittedAndNotCountedWhenAskedNotTo) {
  ann_.uid = 5;
  ExpectRefused(VELK_SHARING_LOGIN_NOT_PERMITTED, false, true);
}

TEST_F(AccountLoginFault, IsPermittedByAnyGroup) {
  Stored(UserLink().set_protect_uids({7}).set_protect_gids({5, 101}));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login());
}

TEST_F(AccountLoginFault, IsNotPermittedByAnotherGroup) {
  Stored(UserLink().set_protect_uids({7}).set_protect_gids({5, 6}));
  EXPECT_EQ(VELK_SHARING_LOGIN_NOT_PERMITTED, Login());
}

TEST_F(AccountLoginFault, IsNotPermittedByANameThatHasGotAnIdSince) {
  Overrides().group_get_gid = [](const char *, unsigned int *) { return -1; };
  has_account_ = false;
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_USER);
  entry.set_protect_users({"ann"}).set_protect_groups({"people"});
  Stored(entry);
  has_account_ = true;
  AnswerForTheAccounts();
  EXPECT_EQ(1u, entry.get_protect_uids().size()) << "the name has an id now";
  EXPECT_EQ(VELK_SHARING_LOGIN_NOT_PERMITTED, Login());
}

TEST_F(AccountLoginFault, NeverLogsTheAccountsPassword) {
  login_answer_ = 0;
  Stored(UserLink());
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_LOGIN_ACCOUNT_REFUSED, Login());
  EXPECT_THAT(log.Texts(), Each(Not(::testing::HasSubstr("account secret"))));
}

// Authorisation

TEST_F(AccessFault, AuthorizationAsksAndWritesInItsOrder) {
  StoreVisitor(SampleEntry("h"));
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  EXPECT_THAT(calls_, ElementsAre("remote ip", "SELECT session", "SELECT entry", "SELECT token",
                                  "UPDATE session", "UPDATE token"));
}

TEST_F(AccessFault, AuthorizationStopsWithoutAnAddress) {
  StoreVisitor(SampleEntry("h"));
  ips_ = {""};
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized());
  EXPECT_THAT(calls_, ElementsAre("remote ip"));
  EXPECT_THAT(log.lines(), ElementsAre(Said("invalid ip")));
}

TEST_F(AccessFault, AuthorizationTakesFailedLookupsAsNothingFound) {
  StoreVisitor(SampleEntry("h"));
  failing_ = "SELECT session";
  EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized());
  failing_ = "SELECT entry";
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized());
  failing_ = "SELECT token";
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized());
}

TEST_F(AccessFault, AuthorizationIsUnusableWhenTheSessionCannotBeWritten) {
  StoreVisitor(SampleEntry("h"));
  failing_ = "UPDATE session";
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized());
  EXPECT_THAT(log.lines(), Contains(Said("update session failed")));
  EXPECT_EQ(0, Count("UPDATE token"));
}

TEST_F(AccessFault, AuthorizationIsUnusableWhenTheGrantCannotBeWritten) {
  StoreVisitor(SampleEntry("h"));
  failing_ = "UPDATE token";
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized());
  EXPECT_THAT(log.lines(), Contains(Said("update token failed")));
}

TEST_F(AccessFault, AuthorizationNeverAsksTheBlocking) {
  StoreVisitor(UserLink(), 1026u);
  denied_answer_ = 1;
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  ann_.uid = 5;
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized());
  for (const char *call : {"denied?", "count", "forget"})
    EXPECT_THAT(calls_, Not(Contains(StartsWith(call)))) << call;
}

/// Time-outs that pass between the lookup of the grant and the check behind it.
class LapsingFault : public AccessFault {
 protected:
  static constexpr long start = 1700000000;

  /// From the lookup of the grant on, the second question for the time finds it `seconds` later.
  void TickAfterTheLookup(long seconds) {
    asked_ = -1;
    const auto watch = Overrides().db_execute;
    Overrides().db_execute = [this, watch](VELKDBHandle *handle, const char *sql,
                                           DBResult **result) {
      if (Summary(sql) == "SELECT token") asked_ = 0;
      return watch(handle, sql, result);
    };
    Overrides().clock = [this, seconds] {
      if (asked_ < 0) return time_t{start};
      return time_t{asked_++ == 0 ? start : start + seconds};
    };
  }

  int asked_ = -1;
};

TEST_F(LapsingFault, ASessionMayLapseWhileItIsChecked) {
  StoreVisitor(SampleEntry("h"), start + 10, start + 1000);
  TickAfterTheLookup(20);
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_LAPSED, Authorized());
  EXPECT_THAT(log.lines(),
              ElementsAre(velk_test::FailedConditionAt("session", 89, "time(NULL) >= timeout_"),
                          Said("session is not valid")));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token"));
}

TEST_F(LapsingFault, AGrantMayLapseWhileItIsCheckedAndIsDeleted) {
  StoreVisitor(SampleEntry("h"), start + 1000, start + 10);
  TickAfterTheLookup(20);
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_LAPSED, Authorized());
  EXPECT_THAT(log.lines(),
              ElementsAre(velk_test::FailedConditionAt("token", 83, "time(NULL) >= timeout_"),
                          Said("token is not valid")));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM token"));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(LapsingFault, AGrantThatHasLapsedAndCannotBeDeletedIsAFailure) {
  StoreVisitor(SampleEntry("h"), start + 1000, start + 10);
  TickAfterTheLookup(20);
  failing_ = "DELETE token";
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized());
  EXPECT_THAT(log.lines(), Contains(Said("token is not valid")));
  EXPECT_THAT(log.lines(), Contains(Said("delete token failed")));
}

TEST_F(LapsingFault, ALinkMayExpireWhileItIsChecked) {
  StoreVisitor(SampleEntry("h").set_expire_at(start + 10), start + 1000, start + 1000);
  TickAfterTheLookup(20);
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized());
  EXPECT_THAT(log.lines(), Contains(Said("entry is not valid")));
}

// Authorisation by account

class AccountAuthorizationFault : public AccessFault {
 protected:
  void SetUp() override {
    AccessFault::SetUp();
    StoreVisitor(UserLink(), 1026u);
  }

  void ExpectRefused(int result) {
    Forget();
    const LogCapture log;
    EXPECT_EQ(result, Authorized());
    EXPECT_THAT(log.lines(), Contains(Said("user login error")));
    EXPECT_EQ(0, Count("UPDATE session"));
    EXPECT_EQ(0, Count("UPDATE token"));
  }
};

TEST_F(AccountAuthorizationFault, ChecksTheRememberedAccount) {
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  EXPECT_EQ(1, Count("uid 1026"));
  EXPECT_THAT(calls_, Not(Contains(StartsWith("login"))));
  EXPECT_EQ(1, Count("free cgi"));
  EXPECT_EQ(1, Count("free user"));
}

TEST_F(AccountAuthorizationFault, LogsInAgainWithAName) {
  params_.username = "typed ann";
  params_.user_password = "account secret";
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  EXPECT_EQ(1, Count("login ann account secret webui 15 1"));
  EXPECT_EQ(0, Count("uid 1026"));
}

TEST_F(AccountAuthorizationFault, RefusesAWrongPassword) {
  params_.username = "ann";
  params_.user_password = "wrong";
  login_answer_ = 0;
  ExpectRefused(VELK_SHARING_AUTH_REFUSED);
  EXPECT_EQ(1, Count("free cgi"));
}

TEST_F(AccountAuthorizationFault, RefusesAnAccountThatIsNotPermittedAnyMore) {
  ann_.uid = 5;
  ExpectRefused(VELK_SHARING_AUTH_LINK_INVALID);
}

TEST_F(AccountAuthorizationFault, IsUnusableWithoutTheAccount) {
  has_account_ = false;
  ExpectRefused(VELK_SHARING_AUTH_UNUSABLE);
}

TEST_F(AccountAuthorizationFault, IsUnusableWithoutTheGroups) {
  has_groups_ = false;
  ExpectRefused(VELK_SHARING_AUTH_UNUSABLE);
  EXPECT_EQ(1, Count("free user"));
}

TEST_F(AccountAuthorizationFault, IsUnusableWithoutARequest) {
  init_answer_ = 0;
  ExpectRefused(VELK_SHARING_AUTH_UNUSABLE);
}

TEST_F(AccountAuthorizationFault, IsUnusableWhenTheCookieCannotBeSet) {
  platform_session_ = "platform-session";
  set_cookies_answer_ = 0;
  ExpectRefused(VELK_SHARING_AUTH_UNUSABLE);
}

TEST_F(AccountAuthorizationFault, ForgetsTheAccountThatLoggedInAgain) {
  RunRaw("UPDATE session SET uid = 5");
  params_.username = "ann";
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized());
  EXPECT_EQ("5", Value("SELECT uid FROM session"));
}

// Logout and use count

TEST_F(AccessFault, LogoutFailsWhenTheGrantCannotBeDeleted) {
  StoreVisitor(SampleEntry("h"));
  failing_ = "DELETE token";
  const LogCapture log;
  EXPECT_EQ(0, VELK::VelkSharingLogout("h", "s"));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) delete failed\n",
                                                 "object_db:# (@) delete failed\n")));
}

TEST_F(AccessFault, LogoutAsksInItsOrder) {
  StoreVisitor(SampleEntry("h"));
  EXPECT_EQ(1, VELK::VelkSharingLogout("h", "s"));
  EXPECT_THAT(calls_,
              ElementsAre("SELECT session", "SELECT entry", "SELECT token", "DELETE token"));
}

TEST_F(AccessFault, UseCountFailsWhenTheLinkCannotBeWritten) {
  Stored(SampleEntry("h"));
  failing_ = "UPDATE entry";
  const LogCapture quiet;
  EXPECT_EQ(0, VELK::VelkSharingIncreaseUseCount("h"));
  EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
}

TEST_F(AccessFault, TheFlatFormLetsNoExceptionOut) {
  StoreVisitor(SampleEntry("h"));
  Overrides().db_execute = [](VELKDBHandle *, const char *, DBResult **) -> int {
    throw std::bad_alloc();
  };
  char buffer[33] = "";
  EXPECT_NO_THROW({
    EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(buffer, sizeof buffer, &params_, 0));
    EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, ::VelkSharingIsAuthorized(&params_));
    EXPECT_EQ(0, ::VelkSharingLogout("h", "s"));
    EXPECT_EQ(0, ::VelkSharingIncreaseUseCount("h"));
  });
  EXPECT_STREQ("", buffer);
}

}  // namespace
