#include <dlfcn.h>
#include <gtest/gtest.h>
#include <velk/velksdk.h>
#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/sample_records.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using ::testing::AnyOf;
using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using VELK::sharing::UID_ERR;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::db::TokenDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using VELK::sharing::record::Token;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::SampleEntry;

const char *const home = "192.0.2.1";
const char *const elsewhere = "2001:db8::7";
constexpr long day = 86400;

/// Takes the databases away when the program ends.
class Leftovers : public ::testing::Environment {
 public:
  void TearDown() override {
    if (!velk_test::OwnsVelkRoot()) return;
    velk_test::RemoveSharingDatabase();
    velk_test::RemoveAutoBlockDatabase();
  }
};

[[maybe_unused]] const ::testing::Environment *const leftovers =
    ::testing::AddGlobalTestEnvironment(new Leftovers);

class Access : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    ASSERT_TRUE(db().IsGood());
    ASSERT_TRUE(db().Execute("DELETE FROM entry; DELETE FROM session; DELETE FROM token"));
    for (const char *variable : {"QUERY_STRING", "HTTP_COOKIE", "CONTENT_LENGTH"})
      unsetenv(variable);
    for (const char *address : {home, elsewhere}) ASSERT_EQ(0, VELKAutoBlockResetByIP(address));
    ComeFrom(home);
  }

  static SharingDB &db() { return SharingDB::Instance(); }

  static void ComeFrom(const char *address) { setenv("REMOTE_ADDR", address, 1); }

  static Entry Stored(Entry entry) {
    EXPECT_TRUE(EntryDB(db()).Create(entry)) << db().GetLastError();
    return entry;
  }

  static Entry StoredWithPassword(const std::string &hash, const std::string &password) {
    Entry entry = SampleEntry(hash);
    entry.set_protect_type(Entry::PROTECT_PASSWORD);
    entry.set_protect_password(password, true, Entry::ENCRYPT_ALGO_DEFAULT);
    return Stored(entry);
  }

  static _tag_sharing_login_params Params(const char *hash, const char *session_id = nullptr,
                                          const char *password = nullptr) {
    return {hash, password, nullptr, nullptr, session_id};
  }

  static int Login(const char *hash, const char *password = nullptr, bool keep = false) {
    std::string ignored;
    const _tag_sharing_login_params params = Params(hash, nullptr, password);
    return VELK::VelkSharingLogin(ignored, &params, keep);
  }

  /// Logs in to a link that lets everybody in.
  static std::string LoggedIn(const char *hash, const char *session_id = nullptr) {
    std::string id;
    const _tag_sharing_login_params params = Params(hash, session_id);
    EXPECT_EQ(VELK_SHARING_LOGIN_OK, VELK::VelkSharingLogin(id, &params, false));
    return id;
  }

  static int Authorized(const char *hash, const std::string &session_id) {
    const _tag_sharing_login_params params = Params(hash, session_id.c_str());
    return VELK::VelkSharingIsAuthorized(&params);
  }

  static std::string Value(const std::string &sql) {
    Result result;
    Row row;
    if (!db().Execute("SELECT (" + sql + ") AS value", result) || !result.NextRow(row)) {
      ADD_FAILURE() << db().GetLastError();
      return "";
    }
    return row.GetField("value").AsString("");
  }

  static long Number(const std::string &sql) { return std::stol(Value(sql)); }

  static void Run(const std::string &sql) { ASSERT_TRUE(db().Execute(sql)) << db().GetLastError(); }

  /// The failures that count against an address.
  static int FailuresOf(const char *address) {
    struct Search {
      std::string address;
      int attempts;
    } search = {address, 0};
    VELKAutoBlockList(
        [](const VELKAutoBlockRecord *record, void *data) {
          auto *wanted = static_cast<Search *>(data);
          if (wanted->address == record->address) wanted->attempts = record->attempts;
          return 0;
        },
        &search);
    return search.attempts;
  }

  static ::testing::Matcher<const velk_test::LogLine &> Said(const std::string &message) {
    return ErrorLine("%s:%d " + message, "sharinglogin:# " + message);
  }
};

void ExpectADayFromNow(long timeout, long from) {
  EXPECT_GE(timeout, from + day);
  EXPECT_LE(timeout, time(nullptr) + day);
}

// Login

TEST_F(Access, LoginOpensALinkWithoutProtection) {
  const Entry entry = Stored(SampleEntry("h"));
  const long from = time(nullptr);
  const LogCapture log;

  const std::string session_id = LoggedIn("h");

  EXPECT_EQ(32u, session_id.size());
  EXPECT_EQ(session_id, Value("SELECT session_id FROM session"));
  EXPECT_EQ(home, Value("SELECT ip FROM session"));
  EXPECT_EQ("4294967295", Value("SELECT uid FROM session"));
  ExpectADayFromNow(Number("SELECT timeout FROM session"), from);
  EXPECT_EQ(Value("SELECT id FROM session"), Value("SELECT session_id FROM token"));
  EXPECT_EQ(entry.get_id(), Number("SELECT entry_id FROM token"));
  ExpectADayFromNow(Number("SELECT timeout FROM token"), from);
  EXPECT_EQ("1", Value("SELECT use_count FROM entry"));
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(Access, LoginIsUnusableWithoutParameters) {
  const LogCapture log;
  std::string session_id = "before";
  const _tag_sharing_login_params no_hash = Params(nullptr);
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, VELK::VelkSharingLogin(session_id, nullptr, false));
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, VELK::VelkSharingLogin(session_id, &no_hash, false));
  EXPECT_EQ("before", session_id);
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(Access, LoginIsUnusableWithoutAnAddress) {
  Stored(SampleEntry("h"));
  unsetenv("REMOTE_ADDR");
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login("h"));
  for (const char *no_address : {"", "example.net", "192.0.2.1; x", "999.1.1.1"}) {
    ComeFrom(no_address);
    EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, Login("h")) << no_address;
  }
  EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
}

TEST_F(Access, LoginRefusesABlockedAddressBeforeAnythingElse) {
  ASSERT_EQ(0, VELKAutoBlockAdd(home, "SHARING", 60));
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_LOGIN_BLOCKED, Login("no such link"));
  EXPECT_THAT(log.lines(), Contains(ErrorLine("%s:%d VelkAutoBlockIsDeniedIP %s",
                                              "sharinglogin:# VelkAutoBlockIsDeniedIP 192.0.2.1")));
}

TEST_F(Access, LoginRefusesAnAddressAfterTenWrongPasswords) {
  StoredWithPassword("h", "secret");
  const LogCapture quiet;
  for (int attempt = 1; attempt <= 10; ++attempt)
    EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login("h", "wrong")) << attempt;
  EXPECT_EQ(VELK_SHARING_LOGIN_BLOCKED, Login("h", "secret"));
  ComeFrom(elsewhere);
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login("h", "secret"));
}

TEST_F(Access, LoginRefusesAnUnknownHashAndDoesNotCountIt) {
  for (const std::string &hash : {std::string("unknown"), std::string(), std::string("' OR '1'='1"),
                                  std::string("\xff\xfe"), std::string(1u << 20, '\'')})
    EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login(hash.c_str()));
  EXPECT_EQ(0, FailuresOf(home));
}

TEST_F(Access, LoginRefusesALinkThatIsNotValidAndDoesNotCountIt) {
  Stored(SampleEntry("disabled").set_enabled(false));
  Stored(SampleEntry("early").set_start_at(time(nullptr) + 60));
  Stored(SampleEntry("late").set_expire_at(time(nullptr) - 1));
  Stored(SampleEntry("over used").set_expire_times(3).set_use_count(4));
  const LogCapture quiet;
  for (const char *hash : {"disabled", "early", "late", "over used"})
    EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login(hash)) << hash;
  EXPECT_EQ(0, FailuresOf(home));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(Access, LoginRefusesALinkWhoseDataIsBroken) {
  Stored(SampleEntry("h"));
  Run("UPDATE entry SET data = '[]'");
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login("h"));
}

TEST_F(Access, LoginRefusesALinkThatIsUsedUpWhileVisitorsMayStay) {
  Stored(SampleEntry("h").set_expire_times(3).set_use_count(2));
  const std::string session_id = LoggedIn("h");
  EXPECT_EQ("3", Value("SELECT use_count FROM entry"));
  EXPECT_EQ(VELK_SHARING_LOGIN_USED_UP, Login("h"));
  EXPECT_EQ("3", Value("SELECT use_count FROM entry"));
  EXPECT_EQ(0, FailuresOf(home));
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));
}

TEST_F(Access, LoginNoticesAUsedUpLinkBeforeTheCredential) {
  StoredWithPassword("h", "secret");
  Run("UPDATE entry SET expire_times = 1, use_count = 1");
  EXPECT_EQ(VELK_SHARING_LOGIN_USED_UP, Login("h", "wrong"));
  EXPECT_EQ(0, FailuresOf(home));
}

TEST_F(Access, LoginAsksForThePassword) {
  StoredWithPassword("h", "secret");
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login("h", "secret"));
}

TEST_F(Access, LoginWithoutAPasswordIsRefusedAndCounted) {
  StoredWithPassword("h", "secret");
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login("h", nullptr));
  EXPECT_EQ(1, FailuresOf(home));
}

TEST_F(Access, LoginWithAWrongPasswordIsRefusedAndCounted) {
  StoredWithPassword("h", "secret");
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login("h", "wrong"));
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login("h", ""));
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD,
            Login("h", std::string(10u << 20, 'x').c_str(), true));
  EXPECT_EQ(3, FailuresOf(home));
  EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(Access, LoginNeverLogsAPasswordOrASessionId) {
  StoredWithPassword("h", "secret");
  const LogCapture log;
  const _tag_sharing_login_params params = {"h", "wrong-password", nullptr, nullptr, "session-id"};
  std::string session_id;
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, VELK::VelkSharingLogin(session_id, &params, false));
  for (const std::string &text : log.Texts())
    EXPECT_THAT(text, Not(AnyOf(HasSubstr("wrong-password"), HasSubstr("session-id"))));
}

TEST_F(Access, LoginLeavesTheSessionIdAloneWhenItFails) {
  StoredWithPassword("h", "secret");
  const _tag_sharing_login_params params = Params("h", nullptr, "wrong");
  std::string session_id = "before";
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, VELK::VelkSharingLogin(session_id, &params, false));
  EXPECT_EQ("before", session_id);
}

TEST_F(Access, LoginForgetsEarlierFailuresUnlessToldToKeepThem) {
  StoredWithPassword("h", "secret");
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login("h", "wrong"));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login("h", "secret", true));
  EXPECT_EQ(1, FailuresOf(home));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, Login("h", "secret", false));
  EXPECT_EQ(0, FailuresOf(home));
}

TEST_F(Access, LoginOfALiveSessionKeepsItAndRenewsIt) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("other"));
  const std::string session_id = LoggedIn("h");
  Run("UPDATE session SET timeout = " + std::to_string(time(nullptr) + 100));
  ComeFrom(elsewhere);
  const long from = time(nullptr);

  EXPECT_EQ(session_id, LoggedIn("other", session_id.c_str()));

  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
  EXPECT_EQ(elsewhere, Value("SELECT ip FROM session"));
  ExpectADayFromNow(Number("SELECT timeout FROM session"), from);
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM token"));
}

TEST_F(Access, LoginWithAnUnknownSessionMakesANewOne) {
  Stored(SampleEntry("h"));
  for (const char *unknown : {"unknown", "", "' OR '1'='1", "\xff"}) {
    const std::string session_id = LoggedIn("h", unknown);
    EXPECT_NE(unknown, session_id);
    EXPECT_EQ(32u, session_id.size());
  }
  EXPECT_EQ("4", Value("SELECT COUNT(*) FROM session"));
}

TEST_F(Access, LoginWithALapsedSessionMakesANewOneThatTakesTheAccountOver) {
  Stored(SampleEntry("h"));
  const std::string lapsed = LoggedIn("h");
  Run("UPDATE session SET timeout = 1000, uid = 1026");
  const LogCapture quiet;

  const std::string fresh = LoggedIn("h", lapsed.c_str());

  EXPECT_NE(lapsed, fresh);
  EXPECT_EQ("1000", Value("SELECT timeout FROM session WHERE session_id = '" + lapsed + "'"));
  EXPECT_EQ("1026", Value("SELECT uid FROM session WHERE session_id = '" + fresh + "'"));
}

TEST_F(Access, LoginTwiceWithOneSessionLeavesOneGrant) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  Run("UPDATE token SET timeout = " + std::to_string(time(nullptr) + 100));
  const long from = time(nullptr);
  LoggedIn("h", session_id.c_str());
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token"));
  ExpectADayFromNow(Number("SELECT timeout FROM token"), from);
  EXPECT_EQ("2", Value("SELECT use_count FROM entry"));
}

TEST_F(Access, LoginAfterTheGrantHasLapsedAddsAnother) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  Run("UPDATE token SET timeout = 1000");
  const LogCapture quiet;
  LoggedIn("h", session_id.c_str());
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM token"));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token WHERE timeout = 1000"));
}

TEST_F(Access, LoginByAccountWithoutANameIsRefusedAndCounted) {
  Stored(SampleEntry("h").set_protect_type(Entry::PROTECT_USER).set_protect_uids({0}));
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, Login("h"));
  EXPECT_EQ(1, FailuresOf(home));
}

TEST_F(Access, LoginStartsNoPurge) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("old").set_expire_at(1));
  Run("INSERT INTO session VALUES (NULL, 'lapsed', '1', 'ip', '1')");
  Run("INSERT INTO token VALUES (NULL, '99', '99', '1')");
  LoggedIn("h");
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM entry"));
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM session"));
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM token"));
}

// Authorisation

TEST_F(Access, AuthorizationPushesBothTimeOuts) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  const std::string soon = std::to_string(time(nullptr) + 100);
  Run("UPDATE session SET timeout = " + soon + "; UPDATE token SET timeout = " + soon);
  const long from = time(nullptr);
  const LogCapture log;

  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));

  ExpectADayFromNow(Number("SELECT timeout FROM session"), from);
  ExpectADayFromNow(Number("SELECT timeout FROM token"), from);
  EXPECT_EQ("1", Value("SELECT use_count FROM entry"));
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(Access, AuthorizationIsUnusableWithoutParameters) {
  const _tag_sharing_login_params no_session = Params("h", nullptr);
  const _tag_sharing_login_params no_hash = Params(nullptr, "s");
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, VELK::VelkSharingIsAuthorized(nullptr));
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, VELK::VelkSharingIsAuthorized(&no_session));
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, VELK::VelkSharingIsAuthorized(&no_hash));
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, ::VelkSharingIsAuthorized(nullptr));
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(Access, AuthorizationIsUnusableWithoutAnAddress) {
  unsetenv("REMOTE_ADDR");
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized("h", "s"));
  EXPECT_THAT(log.lines(), Contains(Said("invalid ip")));
}

TEST_F(Access, AuthorizationKnowsNoUnknownSession) {
  Stored(SampleEntry("h"));
  for (const char *unknown : {"unknown", "", "' OR '1'='1"})
    EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized("h", unknown));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized("unknown", "unknown"));
}

TEST_F(Access, AuthorizationKnowsNoLapsedSession) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  Run("UPDATE session SET timeout = " + std::to_string(time(nullptr)));
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized("h", session_id));
}

TEST_F(Access, AuthorizationNeedsAGrant) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("other"));
  const std::string session_id = LoggedIn("h");
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("other", session_id));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("unknown", session_id));
}

TEST_F(Access, AuthorizationKnowsNoLapsedGrantAndLeavesItToThePurge) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  Run("UPDATE token SET timeout = 1000");
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("h", session_id));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token"));
}

TEST_F(Access, AuthorizationNeedsAValidLink) {
  Stored(SampleEntry("h").set_expire_times(5));
  const std::string session_id = LoggedIn("h");
  for (const char *change :
       {"enabled = 0", "start_at = 20000000000", "expire_at = 1000", "use_count = 6"}) {
    Run("UPDATE entry SET enabled = 1, start_at = 0, expire_at = 0, use_count = 5");
    ASSERT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));
    Run(std::string("UPDATE entry SET ") + change);
    const LogCapture log;
    EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized("h", session_id)) << change;
    EXPECT_THAT(log.lines(), Contains(Said("entry is not valid")));
  }
}

TEST_F(Access, AuthorizationHoldsTheVisitorToTheAddress) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  const std::string before = Value("SELECT timeout FROM session");
  ComeFrom(elsewhere);
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_REFUSED, Authorized("h", session_id));
  EXPECT_THAT(log.lines(),
              Contains(ErrorLine("%s:%d ip not match, %s, %s",
                                 "sharinglogin:# ip not match, 2001:db8::7, 192.0.2.1")));
  EXPECT_EQ(before, Value("SELECT timeout FROM session"));
}

TEST_F(Access, AuthorizationComparesAddressesByteForByte) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  const LogCapture quiet;
  for (const char *address : {"192.0.2.11", "192.0.2.", "192.0.2.2"}) {
    Run(std::string("UPDATE session SET ip = '") + address + "'");
    EXPECT_EQ(VELK_SHARING_AUTH_REFUSED, Authorized("h", session_id)) << address;
  }
}

TEST_F(Access, AuthorizationLetsTheVisitorMoveWhereTheLinkAllowsIt) {
  Stored(SampleEntry("h").set_enable_match_ip(false));
  const std::string session_id = LoggedIn("h");
  ComeFrom(elsewhere);
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));
  EXPECT_EQ(home, Value("SELECT ip FROM session"));
}

TEST_F(Access, AuthorizationNeverTouchesTheBlocking) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  ASSERT_EQ(0, AutoBlockFailLoginSet(home, "SHARING"));
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized("h", "unknown"));
  EXPECT_EQ(1, FailuresOf(home));
  ASSERT_EQ(0, VELKAutoBlockAdd(home, "SHARING", 60));
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", session_id));
}

/// A visitor who once logged in with an account to a link that asks for one.
class AccessByAccount : public Access {
 protected:
  void SetUp() override {
    Access::SetUp();
    if (IsSkipped()) return;
    entry_ = Stored(SampleEntry("h").set_protect_type(Entry::PROTECT_USER).set_protect_uids({0}));
    Session session = velk_test::SampleSession("s").set_uid(0);
    ASSERT_TRUE(SessionDB(db()).Create(session));
    Token token = velk_test::SampleToken(session.get_id(), entry_.get_id());
    ASSERT_TRUE(TokenDB(db()).Create(token));
  }

  void Permit(const std::string &lists) {
    Run("UPDATE entry SET data = '" + db().Escape(R"({"app":{},"protect_type":"user",)" + lists) +
        "}'");
  }

  Entry entry_;
};

TEST_F(AccessByAccount, AuthorizationRemembersTheAccount) {
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", "s"));
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(AccessByAccount, AuthorizationPermitsByGroup) {
  Permit(R"("protect_uids":[3999999999],"protect_gids":[3999999999,0])");
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("h", "s"));
}

TEST_F(AccessByAccount, AuthorizationRefusesAnAccountThatIsNotPermitted) {
  Permit(R"("protect_uids":[3999999999],"protect_gids":[3999999998])");
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized("h", "s"));
  EXPECT_THAT(log.lines(), Contains(Said("user login error")));
}

TEST_F(AccessByAccount, AuthorizationDoesNotCountNamesWithoutAnId) {
  Permit(R"("protect_extra_users":["root"],"protect_extra_groups":["root"])");
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized("h", "s"));
}

TEST_F(AccessByAccount, AuthorizationCannotCheckASessionWithoutAnAccount) {
  Run("UPDATE session SET uid = 4294967295");
  const LogCapture log;
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, Authorized("h", "s"));
  EXPECT_THAT(log.lines(), Contains(Said("user login error")));
}

TEST_F(AccessByAccount, AuthorizationChecksTheAccountBeforeTheAddress) {
  Permit(R"("protect_uids":[3999999999],"enable_match_ip":true)");
  ComeFrom(elsewhere);
  const LogCapture quiet;
  EXPECT_EQ(VELK_SHARING_AUTH_LINK_INVALID, Authorized("h", "s"));
}

// Logout

TEST_F(Access, LogoutTakesOneGrantAway) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("other"));
  const std::string session_id = LoggedIn("h");
  LoggedIn("other", session_id.c_str());
  const LogCapture log;

  EXPECT_EQ(1, VELK::VelkSharingLogout("h", session_id));

  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("h", session_id));
  EXPECT_EQ(VELK_SHARING_AUTH_OK, Authorized("other", session_id));
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM session"));
  EXPECT_THAT(log.Texts(), IsEmpty());
}

TEST_F(Access, LogoutNeedsASession) {
  Stored(SampleEntry("h"));
  const LogCapture log;
  EXPECT_EQ(0, VELK::VelkSharingLogout("h", "unknown"));
  EXPECT_THAT(log.lines(), Contains(Said("get session failed")));
}

TEST_F(Access, LogoutNeedsALink) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  const LogCapture log;
  EXPECT_EQ(0, VELK::VelkSharingLogout("unknown", session_id));
  EXPECT_THAT(log.lines(), Contains(Said("get entry failed")));
}

TEST_F(Access, LogoutNeedsAGrant) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("other"));
  const std::string session_id = LoggedIn("h");
  const LogCapture log;
  EXPECT_EQ(0, VELK::VelkSharingLogout("other", session_id));
  EXPECT_THAT(log.lines(), Contains(Said("get token failed")));
}

TEST_F(Access, LogoutNeedsNoAddress) {
  Stored(SampleEntry("h"));
  const std::string session_id = LoggedIn("h");
  unsetenv("REMOTE_ADDR");
  EXPECT_EQ(1, VELK::VelkSharingLogout("h", session_id));
}

// Use count

TEST_F(Access, UsesAreCountedWithoutALimit) {
  Stored(SampleEntry("h").set_expire_times(1).set_use_count(1));
  EXPECT_EQ(1, VELK::VelkSharingIncreaseUseCount("h"));
  EXPECT_EQ(1, ::VelkSharingIncreaseUseCount("h"));
  EXPECT_EQ("3", Value("SELECT use_count FROM entry"));
}

TEST_F(Access, UsesOfAnUnknownLinkAreNotCounted) {
  EXPECT_EQ(0, VELK::VelkSharingIncreaseUseCount("unknown"));
  EXPECT_EQ(0, ::VelkSharingIncreaseUseCount("unknown"));
}

// Deleted records

TEST_F(Access, AVisitorOfADeletedLinkStaysOutOfTheNextOne) {
  const Entry old = Stored(SampleEntry("old"));
  const std::string session_id = LoggedIn("old");
  ASSERT_TRUE(EntryDB(db()).Delete(old));
  Stored(SampleEntry("new"));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("new", session_id));
}

TEST_F(Access, AVisitorDoesNotInheritTheGrantsOfADeletedSession) {
  Stored(SampleEntry("h"));
  Stored(SampleEntry("open"));
  const std::string old = LoggedIn("h");
  ASSERT_TRUE(SessionDB(db()).DeleteBySessionId(old));
  const std::string session_id = LoggedIn("open");
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, Authorized("h", session_id));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_SESSION, Authorized("h", old));
}

// The flat form

class FlatAccess : public Access {};

TEST_F(FlatAccess, HasSymbolsThatCCodeFinds) {
  for (const char *name : {"VelkSharingLogin", "VelkSharingIsAuthorized", "VelkSharingLogout",
                           "VelkSharingIncreaseUseCount"})
    EXPECT_NE(nullptr, dlsym(RTLD_DEFAULT, name)) << name;
}

TEST_F(FlatAccess, GoesThroughAWholeVisit) {
  Stored(SampleEntry("h"));
  char session_id[33] = "";
  _tag_sharing_login_params params = Params("h");
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(session_id, sizeof session_id, &params, 0));
  EXPECT_EQ(32u, strlen(session_id));
  params.session_id = session_id;
  EXPECT_EQ(VELK_SHARING_AUTH_OK, ::VelkSharingIsAuthorized(&params));
  EXPECT_EQ(1, ::VelkSharingLogout("h", session_id));
  EXPECT_EQ(VELK_SHARING_AUTH_NO_GRANT, ::VelkSharingIsAuthorized(&params));
}

TEST_F(FlatAccess, LoginCutsTheSessionIdToTheBuffer) {
  Stored(SampleEntry("h"));
  char buffer[12];
  memset(buffer, 'x', sizeof buffer);
  const _tag_sharing_login_params params = Params("h");
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(buffer, 10, &params, 0));
  EXPECT_EQ(Value("SELECT substr(session_id, 1, 9) FROM session"), std::string(buffer, 9));
  EXPECT_EQ('\0', buffer[9]);
  EXPECT_EQ("xx", std::string(buffer + 10, 2)) << "written past the buffer";
}

TEST_F(FlatAccess, LoginWritesTheSessionIdAndTheLastByteOnly) {
  Stored(SampleEntry("h"));
  char buffer[40];
  memset(buffer, 'x', sizeof buffer);
  const _tag_sharing_login_params params = Params("h");
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(buffer, sizeof buffer, &params, 0));
  EXPECT_EQ(Value("SELECT session_id FROM session"), std::string(buffer, 32));
  EXPECT_EQ("xxxxxxx", std::string(buffer + 32, 7));
  EXPECT_EQ('\0', buffer[39]);
}

TEST_F(FlatAccess, LoginThatFailsWritesTheLastByteOnly) {
  char buffer[8];
  memset(buffer, 'x', sizeof buffer);
  const _tag_sharing_login_params params = Params("unknown");
  EXPECT_EQ(VELK_SHARING_LOGIN_REFUSED, ::VelkSharingLogin(buffer, sizeof buffer, &params, 0));
  EXPECT_EQ("xxxxxxx", std::string(buffer, 7));
  EXPECT_EQ('\0', buffer[7]);
}

TEST_F(FlatAccess, LoginFillsABufferOfOneByte) {
  Stored(SampleEntry("h"));
  char buffer[2] = {'x', 'x'};
  const _tag_sharing_login_params params = Params("h");
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(buffer, 1, &params, 0));
  EXPECT_EQ('\0', buffer[0]);
  EXPECT_EQ('x', buffer[1]);
}

TEST_F(FlatAccess, LoginDoesNothingWithoutABuffer) {
  Stored(SampleEntry("h"));
  char buffer[2] = {'x', 'x'};
  const _tag_sharing_login_params params = Params("h");
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(nullptr, 33, &params, 0));
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(nullptr, 0, &params, 0));
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(buffer, 0, &params, 0));
  EXPECT_EQ('x', buffer[0]);
  EXPECT_EQ("0", Value("SELECT use_count FROM entry"));
}

TEST_F(FlatAccess, LoginKeepsTheBlockStateForOneOnly) {
  StoredWithPassword("h", "secret");
  char buffer[33] = "";
  const _tag_sharing_login_params params = Params("h", nullptr, "secret");
  EXPECT_EQ(VELK_SHARING_LOGIN_WRONG_PASSWORD, Login("h", "wrong"));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(buffer, sizeof buffer, &params, 1));
  EXPECT_EQ(1, FailuresOf(home));
  EXPECT_EQ(VELK_SHARING_LOGIN_OK, ::VelkSharingLogin(buffer, sizeof buffer, &params, 2));
  EXPECT_EQ(0, FailuresOf(home));
}

TEST_F(FlatAccess, AnswersNullWithItsFailureCode) {
  char buffer[33] = "";
  EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(buffer, sizeof buffer, nullptr, 0));
  EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, ::VelkSharingIsAuthorized(nullptr));
  EXPECT_EQ(0, ::VelkSharingLogout(nullptr, "s"));
  EXPECT_EQ(0, ::VelkSharingLogout("h", nullptr));
  EXPECT_EQ(0, ::VelkSharingIncreaseUseCount(nullptr));
}

}  // namespace
