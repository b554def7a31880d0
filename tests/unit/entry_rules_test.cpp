#include <gtest/gtest.h>
#include <velksharing/constants.h>
#include <velksharing/record.h>

#include <climits>
#include <cstdlib>
#include <ctime>
#include <set>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/sample_records.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::UID_ERR;
using VELK::sharing::record::Entry;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::SampleEntry;

const char *const json_time = "%Y-%m-%d %H:%M:%S";
const char *const unknown_user = "velk-no-such-user";
const char *const unknown_group = "velk-no-such-group";
constexpr unsigned int unknown_id = 3999999999u;

Entry PasswordEntry(const std::string &password, Entry::PasswordEncryptAlgo algo) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD).set_protect_password(password, true, algo);
  return entry;
}

void ExpectIllegal(const Entry &entry, const std::string &condition) {
  const LogCapture log;
  EXPECT_FALSE(entry.IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition("entry", condition)));
}

void ExpectLegal(const Entry &entry) {
  const LogCapture log;
  EXPECT_TRUE(entry.IsLegal());
  EXPECT_THAT(log.Texts(), IsEmpty());
}

void ExpectInvalid(const Entry &entry, const std::string &condition) {
  const LogCapture log;
  EXPECT_FALSE(entry.IsValid());
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition("entry", condition)));
}

void ExpectValid(const Entry &entry) {
  const LogCapture log;
  EXPECT_TRUE(entry.IsValid());
  EXPECT_THAT(log.Texts(), IsEmpty());
}

/// Local time by a rule of its own while it lives.
class TimeZone {
 public:
  explicit TimeZone(const char *rule) {
    const char *before = getenv("TZ");
    had_ = before != nullptr;
    if (had_) before_ = before;
    setenv("TZ", rule, 1);
    tzset();
  }
  TimeZone(const TimeZone &) = delete;
  TimeZone &operator=(const TimeZone &) = delete;
  ~TimeZone() {
    if (had_)
      setenv("TZ", before_.c_str(), 1);
    else
      unsetenv("TZ");
    tzset();
  }

 private:
  bool had_ = false;
  std::string before_;
};

TEST(EntryIsLegal, AcceptsACompleteLink) {
  ExpectLegal(SampleEntry("h"));
}

TEST(EntryIsLegal, RefusesAfterAFailedPassword) {
  Entry entry = SampleEntry("");
  entry.set_protect_password("", true, Entry::ENCRYPT_ALGO_MD5);
  ExpectIllegal(entry, "!blValid_");
}

TEST(EntryIsLegal, RefusesWithoutAHash) {
  ExpectIllegal(Entry(), "\"\" == hash_");
}

TEST(EntryIsLegal, RefusesWithoutAProject) {
  ExpectIllegal(Entry().set_hash("h"), "\"\" == project_name_");
}

TEST(EntryIsLegal, RefusesWithoutAnOwner) {
  ExpectIllegal(Entry().set_hash("h").set_project_name("p"), "UID_ERR == owner_uid_");
}

TEST(EntryIsLegal, RefusesApplicationDataThatIsNoObject) {
  Entry entry = SampleEntry("h");
  for (const Json::Value &value :
       {Json::Value(), Json::Value(Json::arrayValue), Json::Value("x"), Json::Value(1)}) {
    ExpectIllegal(entry.set_app(value), "! app_.isObject()");
  }
}

TEST(EntryIsLegal, RefusesPrivateDataThatIsNoObject) {
  Entry entry = SampleEntry("h");
  for (const Json::Value &value :
       {Json::Value(), Json::Value(Json::arrayValue), Json::Value("x")}) {
    ExpectIllegal(entry.set_private_data(value), "! private_data_.isObject()");
  }
}

TEST(EntryIsLegal, RefusesAPasswordLinkWithoutAPassword) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  ExpectIllegal(entry, "Entry::PROTECT_PASSWORD == protect_type_ && \"\" == protect_password_");
}

TEST(EntryIsLegal, RefusesASaltedDigestWithoutItsSalt) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  entry.set_protect_password("digest", false, Entry::ENCRYPT_ALGO_DEFAULT);
  ExpectIllegal(entry,
                "Entry::PROTECT_PASSWORD == protect_type_ && Entry::ENCRYPT_ALGO_DEFAULT == "
                "protect_password_algo_ && \"\" == protect_password_salt_");
}

TEST(EntryIsLegal, AcceptsAnUnsaltedDigestWithoutASalt) {
  ExpectLegal(PasswordEntry("secret", Entry::ENCRYPT_ALGO_MD5));
}

TEST(EntryIsLegal, RefusesAUserLinkThatPermitsNobody) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_USER);
  ExpectIllegal(entry,
                "Entry::PROTECT_USER == protect_type_ && (0 == protect_uids_.size() + "
                "protect_extra_users_.size() + protect_gids_.size() + "
                "protect_extra_groups_.size())");
}

TEST(EntryIsLegal, AcceptsAUserLinkThatPermitsAnyone) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_USER);
  ExpectLegal(Entry(entry).set_protect_uids({1026}));
  ExpectLegal(Entry(entry).set_protect_gids({100}));
  ExpectLegal(Entry(entry).set_protect_users({unknown_user}));
  ExpectLegal(Entry(entry).set_protect_groups({unknown_group}));
}

TEST(EntryIsLegal, AsksNothingOfAnUnknownProtection) {
  ExpectLegal(SampleEntry("h").set_protect_type(static_cast<Entry::ProtectType>(3)));
}

TEST(EntryIsLegal, LogsTheFirstOfSeveralReasons) {
  Entry entry;
  entry.set_protect_type(Entry::PROTECT_USER);
  ExpectIllegal(entry, "\"\" == hash_");
}

TEST(EntryIsValid, AcceptsAnOpenLink) {
  ExpectValid(SampleEntry("h"));
}

TEST(EntryIsValid, RefusesAnIllegalLinkAndLogsBoth) {
  const LogCapture log;
  EXPECT_FALSE(Entry().IsValid());
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition("entry", "\"\" == hash_"),
                                       FailedCondition("entry", "! IsLegal()")));
}

TEST(EntryIsValid, RefusesADisabledLink) {
  ExpectInvalid(SampleEntry("h").set_enabled(false), "! enabled_");
}

TEST(EntryIsValid, RefusesALinkThatHasNotStarted) {
  ExpectInvalid(SampleEntry("h").set_start_at(time(nullptr) + 60),
                "0 < start_at_ && start_at_ > timeNow");
}

TEST(EntryIsValid, AcceptsALinkFromItsFirstSecondOn) {
  ExpectValid(SampleEntry("h").set_start_at(time(nullptr)));
}

TEST(EntryIsValid, RefusesALinkAfterItsLastSecond) {
  ExpectInvalid(SampleEntry("h").set_expire_at(time(nullptr) - 1),
                "0 < expire_at_ && timeNow > expire_at_");
}

TEST(EntryIsValid, AcceptsALinkDuringItsLastSecond) {
  // The clock may tick between the two lines; the exact second is pinned with a stopped clock in
  // the fault tests.
  ExpectValid(SampleEntry("h").set_expire_at(time(nullptr) + 1));
}

TEST(EntryIsValid, TakesTimesUpToZeroAsNoLimit) {
  ExpectValid(SampleEntry("h").set_start_at(0).set_expire_at(0));
  ExpectValid(SampleEntry("h").set_start_at(-5).set_expire_at(-5));
  ExpectValid(SampleEntry("h").set_start_at(LONG_MIN).set_expire_at(LONG_MIN));
}

TEST(EntryIsValid, AcceptsALinkThatHasJustBeenUsedUp) {
  ExpectValid(SampleEntry("h").set_expire_times(3).set_use_count(3));
}

TEST(EntryIsValid, RefusesALinkThatIsOverUsed) {
  ExpectInvalid(SampleEntry("h").set_expire_times(3).set_use_count(4),
                "0 < expire_times_ && use_count_ > expire_times_");
}

TEST(EntryIsValid, TakesUsesUpToZeroAsNoLimit) {
  ExpectValid(SampleEntry("h").set_expire_times(0).set_use_count(INT_MAX));
  ExpectValid(SampleEntry("h").set_expire_times(-3).set_use_count(INT_MAX));
}

TEST(EntryIsValid, LogsTheFirstOfSeveralReasons) {
  ExpectInvalid(SampleEntry("h").set_enabled(false).set_expire_at(1), "! enabled_");
  ExpectInvalid(SampleEntry("h").set_expire_at(1).set_expire_times(1).set_use_count(9),
                "0 < expire_at_ && timeNow > expire_at_");
}

TEST(EntryPassword, OpensWithTheRightPasswordOnly) {
  for (const auto algo : {Entry::ENCRYPT_ALGO_DEFAULT, Entry::ENCRYPT_ALGO_MD5}) {
    const Entry entry = PasswordEntry("secret", algo);
    EXPECT_TRUE(entry.IsPasswordValid("secret"));
    for (const char *wrong : {"", "Secret", "secret ", "secre", "secrets"})
      EXPECT_FALSE(entry.IsPasswordValid(wrong)) << wrong;
    EXPECT_FALSE(entry.IsPasswordValid(std::string("secret\0", 7)));
    EXPECT_FALSE(entry.IsPasswordValid(entry.get_protect_password()));
  }
}

TEST(EntryPassword, IsNeverStoredAsItIs) {
  EXPECT_EQ(40u,
            PasswordEntry("secret", Entry::ENCRYPT_ALGO_DEFAULT).get_protect_password().size());
  EXPECT_EQ("5ebe2294ecd0e0f08eab7690d2a6ee69",
            PasswordEntry("secret", Entry::ENCRYPT_ALGO_MD5).get_protect_password());
}

TEST(EntryPassword, GetsAFreshSaltEveryTime) {
  Entry entry;
  std::set<std::string> salts;
  std::set<std::string> digests;
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  for (int round = 0; round < 20; ++round) {
    entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT);
    EXPECT_TRUE(entry.IsPasswordValid("secret"));
    EXPECT_EQ(6u, entry.get_protect_password_salt().size());
    EXPECT_EQ(std::string::npos,
              entry.get_protect_password_salt().find_first_not_of(
                  "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789"));
    salts.insert(entry.get_protect_password_salt());
    digests.insert(entry.get_protect_password());
  }
  EXPECT_EQ(20u, salts.size());
  EXPECT_EQ(20u, digests.size());
}

TEST(EntryPassword, MayBeEmptyWithASalt) {
  const Entry entry = PasswordEntry("", Entry::ENCRYPT_ALGO_DEFAULT);
  ExpectLegal(entry);
  EXPECT_TRUE(entry.IsPasswordValid(""));
  EXPECT_FALSE(entry.IsPasswordValid("x"));
}

TEST(EntryPassword, MustNotBeEmptyWithoutASalt) {
  Entry entry = PasswordEntry("secret", Entry::ENCRYPT_ALGO_MD5);
  entry.set_protect_password("", true, Entry::ENCRYPT_ALGO_MD5);
  EXPECT_EQ("", entry.get_protect_password());
  ExpectIllegal(entry, "!blValid_");
  EXPECT_FALSE(entry.IsPasswordValid(""));
}

TEST(EntryPassword, MakesTheLinkLegalAgainOnceItWorks) {
  Entry entry = PasswordEntry("", Entry::ENCRYPT_ALGO_MD5);
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_MD5);
  ExpectLegal(entry);
}

TEST(EntryPassword, IsTakenAsADigestWithoutHashing) {
  Entry entry = PasswordEntry("secret", Entry::ENCRYPT_ALGO_DEFAULT);
  const std::string salt = entry.get_protect_password_salt();
  entry.set_protect_password("plain", false, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_EQ("plain", entry.get_protect_password());
  EXPECT_EQ(salt, entry.get_protect_password_salt());
  EXPECT_FALSE(entry.IsPasswordValid("plain"));
}

TEST(EntryPassword, OpensWithADigestThatWasCarriedOver) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  entry.set_protect_password("5ebe2294ecd0e0f08eab7690d2a6ee69", false, Entry::ENCRYPT_ALGO_MD5);
  EXPECT_TRUE(entry.IsPasswordValid("secret"));
}

TEST(EntryPassword, OpensWithASaltedDigestThatWasCarriedOver) {
  Entry entry = PasswordEntry("secret", Entry::ENCRYPT_ALGO_DEFAULT);
  const std::string digest = entry.get_protect_password();
  entry.set_protect_password("other", false, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_FALSE(entry.IsPasswordValid("secret"));
  entry.set_protect_password(digest, false, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_TRUE(entry.IsPasswordValid("secret"));
}

TEST(EntryPassword, ComparesDigestsInTheirLowercaseForm) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  entry.set_protect_password("5EBE2294ECD0E0F08EAB7690D2A6EE69", false, Entry::ENCRYPT_ALGO_MD5);
  EXPECT_FALSE(entry.IsPasswordValid("secret"));
}

TEST(EntryPassword, DoesNotTouchSaltOrProtectionWithMd5) {
  Entry entry = SampleEntry("h");
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT);
  const std::string salt = entry.get_protect_password_salt();
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_MD5);
  EXPECT_EQ(salt, entry.get_protect_password_salt());
  EXPECT_EQ(Entry::ENCRYPT_ALGO_MD5, entry.get_protect_password_algo());
  EXPECT_EQ(Entry::PROTECT_NONE, entry.get_protect_type());
}

TEST(EntryPassword, OpensEveryLinkThatHasNone) {
  Entry entry = SampleEntry("h");
  EXPECT_TRUE(entry.IsPasswordValid("any"));
  EXPECT_TRUE(entry.IsPasswordValid(""));
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_TRUE(entry.IsPasswordValid("wrong"));
  entry.set_protect_type(Entry::PROTECT_USER);
  EXPECT_TRUE(entry.IsPasswordValid("wrong"));
}

TEST(EntryOwner, IsKnownByName) {
  Entry entry;
  entry.set_owner_uid(0);
  EXPECT_EQ("root", entry.get_owner_user());
  entry.set_owner_uid(7).set_owner_user("root");
  EXPECT_EQ(0u, entry.get_owner_uid());
}

TEST(EntryOwner, IsNobodyForAnUnknownName) {
  Entry entry;
  entry.set_owner_uid(0).set_owner_user(unknown_user);
  EXPECT_EQ(UID_ERR, entry.get_owner_uid());
  EXPECT_EQ("", entry.get_owner_user());
}

TEST(EntryOwner, HasNoNameForAnUnknownId) {
  EXPECT_EQ("", Entry().set_owner_uid(unknown_id).get_owner_user());
}

TEST(EntryTime, IsShownInLocalTime) {
  const TimeZone zone("EST5");
  Entry entry;
  entry.set_start_at(1709210096).set_expire_at(-1);
  EXPECT_EQ("2024-02-29 07:34:56", entry.get_start_at_str(json_time));
  EXPECT_EQ("1969-12-31 18:59:59", entry.get_expire_at_str(json_time));
}

TEST(EntryTime, IsEmptyWhenNotSet) {
  EXPECT_EQ("", Entry().get_start_at_str(json_time));
  EXPECT_EQ("", Entry().get_expire_at_str(json_time));
}

TEST(EntryTime, IsEmptyWhenTheTextWouldBe) {
  Entry entry;
  entry.set_start_at(1709210096);
  EXPECT_EQ("", entry.get_start_at_str(""));
  EXPECT_EQ("", entry.get_start_at_str(nullptr));
}

TEST(EntryTime, IsShownInAtMost127Bytes) {
  Entry entry;
  entry.set_start_at(1709210096);
  EXPECT_EQ(std::string(127, 'x'), entry.get_start_at_str(std::string(127, 'x').c_str()));
  EXPECT_EQ("", entry.get_start_at_str(std::string(128, 'x').c_str()));
  EXPECT_EQ("", entry.get_start_at_str(std::string(100000, 'x').c_str()));
}

TEST(EntryTime, IsEmptyBeyondTheCalendar) {
  Entry entry;
  entry.set_start_at(LONG_MAX).set_expire_at(LONG_MIN);
  EXPECT_EQ("", entry.get_start_at_str(json_time));
  EXPECT_EQ("", entry.get_expire_at_str(json_time));
}

TEST(EntryTime, IsReadInLocalTime) {
  const TimeZone zone("EST5");
  Entry entry;
  entry.set_start_at_str("2024-02-29 07:34:56", json_time);
  entry.set_expire_at_str("29.02.2024", "%d.%m.%Y");
  EXPECT_EQ(1709210096, entry.get_start_at());
  EXPECT_EQ(1709182800, entry.get_expire_at());
}

TEST(EntryTime, IsReadWithTodaysDaylightSaving) {
  const TimeZone always_summer("EST5EDT4,0/0,J365/25");
  Entry entry;
  entry.set_start_at_str("2024-01-15 12:00:00", json_time);
  EXPECT_EQ(1705334400, entry.get_start_at());  // 16:00 UTC
}

TEST(EntryTime, IsReadAfter2038) {
  const TimeZone zone("UTC0");
  Entry entry;
  entry.set_expire_at_str("2100-01-01 00:00:00", json_time);
  EXPECT_EQ(4102444800L, entry.get_expire_at());
}

TEST(EntryTime, IsClearedByTextThatDoesNotFit) {
  for (const char *text : {"", "tomorrow", "2024-02", "2024-13-01 00:00:00"}) {
    Entry entry;
    entry.set_start_at(5).set_expire_at(6);
    entry.set_start_at_str(text, json_time).set_expire_at_str(text, json_time);
    EXPECT_EQ(0, entry.get_start_at()) << text;
    EXPECT_EQ(0, entry.get_expire_at()) << text;
  }
}

TEST(EntryTime, IsClearedByAMissingFormat) {
  Entry entry;
  entry.set_start_at(5).set_start_at_str("2024", nullptr);
  EXPECT_EQ(0, entry.get_start_at());
}

TEST(EntryTime, IgnoresTextBehindTheFormat) {
  const TimeZone zone("UTC0");
  Entry entry;
  entry.set_start_at_str("1970-01-02 and more", "%Y-%m-%d");
  EXPECT_EQ(86400, entry.get_start_at());
}

TEST(EntryUsers, AreKeptAsIdsWhereTheyAreKnown) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_USER).set_protect_users({"root", unknown_user});
  EXPECT_THAT(entry.get_protect_uids(), ElementsAre(0u));
  EXPECT_THAT(entry.get_protect_users(), ElementsAre("root", unknown_user));
  ExpectLegal(entry);
}

TEST(EntryUsers, ListKnownNamesFirst) {
  Entry entry;
  entry.set_protect_users({unknown_user, "root", "root"});
  EXPECT_THAT(entry.get_protect_uids(), ElementsAre(0u, 0u));
  EXPECT_THAT(entry.get_protect_users(), ElementsAre("root", "root", unknown_user));
}

TEST(EntryUsers, AreReplacedByNames) {
  Entry entry;
  entry.set_protect_users({unknown_user, "root"}).set_protect_users({"velk-other-user"});
  EXPECT_THAT(entry.get_protect_uids(), IsEmpty());
  EXPECT_THAT(entry.get_protect_users(), ElementsAre("velk-other-user"));
}

TEST(EntryUsers, AreReplacedByIds) {
  Entry entry;
  entry.set_protect_users({unknown_user}).set_protect_uids({unknown_id, 0, 0});
  EXPECT_THAT(entry.get_protect_uids(), ElementsAre(unknown_id, 0u, 0u));
  EXPECT_THAT(entry.get_protect_users(), ElementsAre("root", "root"));
}

TEST(EntryUsers, DoNotTouchTheGroups) {
  Entry entry;
  entry.set_protect_groups({"root", unknown_group});
  entry.set_protect_users({"root"}).set_protect_uids({5});
  EXPECT_THAT(entry.get_protect_groups(), ElementsAre("root", unknown_group));
}

TEST(EntryGroups, AreKeptAsIdsWhereTheyAreKnown) {
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_USER).set_protect_groups({unknown_group, "root"});
  EXPECT_THAT(entry.get_protect_gids(), ElementsAre(0u));
  EXPECT_THAT(entry.get_protect_groups(), ElementsAre("root", unknown_group));
  ExpectLegal(entry);
}

TEST(EntryGroups, AreReplacedByIds) {
  Entry entry;
  entry.set_protect_groups({unknown_group}).set_protect_gids({unknown_id, 0});
  EXPECT_THAT(entry.get_protect_gids(), ElementsAre(unknown_id, 0u));
  EXPECT_THAT(entry.get_protect_groups(), ElementsAre("root"));
}

TEST(EntryGroups, AreReplacedByNames) {
  Entry entry;
  entry.set_protect_groups({"root", unknown_group}).set_protect_groups({});
  EXPECT_THAT(entry.get_protect_gids(), IsEmpty());
  EXPECT_THAT(entry.get_protect_groups(), IsEmpty());
}

TEST(EntryJson, HoldsWhatFrontEndsMaySee) {
  const TimeZone zone("UTC0");
  Entry entry = SampleEntry("h");
  entry.set_id(7).set_owner_uid(0).set_start_at(86400).set_expire_times(5).set_use_count(2);
  entry.set_protect_title("Family").set_redirect_uri("/photo");
  entry.set_protect_users({"root", unknown_user}).set_protect_groups({unknown_group});
  Json::Value app(Json::objectValue);
  app["path"] = "/volume1";
  entry.set_app(app);

  Json::Value json("replaced");
  entry.ToJSON(json);

  EXPECT_THAT(json.getMemberNames(),
              ElementsAre("app", "auto_gc", "enable_match_ip", "enabled", "expire_at",
                          "expire_times", "hash", "owner_user", "project_name", "protect_groups",
                          "protect_title", "protect_type", "protect_users", "redirect_type",
                          "redirect_uri", "start_at", "use_count"));
  EXPECT_EQ("h", json["hash"].asString());
  EXPECT_EQ("photo", json["project_name"].asString());
  EXPECT_EQ(Json::Value(true), json["enabled"]);
  EXPECT_EQ("root", json["owner_user"].asString());
  EXPECT_EQ("1970-01-02 00:00:00", json["start_at"].asString());
  EXPECT_EQ("", json["expire_at"].asString());
  EXPECT_EQ(5, json["expire_times"].asInt());
  EXPECT_EQ(2, json["use_count"].asInt());
  EXPECT_EQ(Json::Value(true), json["auto_gc"]);
  EXPECT_EQ(Json::Value(true), json["enable_match_ip"]);
  EXPECT_EQ("Family", json["protect_title"].asString());
  EXPECT_EQ("none", json["protect_type"].asString());
  ASSERT_EQ(2u, json["protect_users"].size());
  EXPECT_EQ("root", json["protect_users"][0].asString());
  EXPECT_EQ(unknown_user, json["protect_users"][1].asString());
  ASSERT_EQ(1u, json["protect_groups"].size());
  EXPECT_EQ(unknown_group, json["protect_groups"][0].asString());
  EXPECT_EQ("none", json["redirect_type"].asString());
  EXPECT_EQ("/photo", json["redirect_uri"].asString());
  EXPECT_EQ(app, json["app"]);
}

TEST(EntryJson, ReplacesWhatWasThere) {
  Json::Value json(Json::objectValue);
  json["old"] = 1;
  Entry().ToJSON(json);
  EXPECT_FALSE(json.isMember("old"));
}

TEST(EntryJson, HasListsEvenWhenNobodyIsPermitted) {
  Json::Value json;
  Entry().ToJSON(json);
  EXPECT_TRUE(json["protect_users"].isArray());
  EXPECT_TRUE(json["protect_groups"].isArray());
  EXPECT_TRUE(json["app"].isNull());
}

TEST(EntryJson, HasAnEmptyOwnerForAnUnknownId) {
  Json::Value json;
  Entry().set_owner_uid(unknown_id).ToJSON(json);
  EXPECT_EQ(Json::Value(""), json["owner_user"]);
}

TEST(EntryJson, HoldsNoSecret) {
  Entry entry = PasswordEntry("secret", Entry::ENCRYPT_ALGO_DEFAULT);
  Json::Value private_data(Json::objectValue);
  private_data["note"] = "hidden";
  entry.set_private_data(private_data);
  Json::Value json;
  entry.ToJSON(json);
  const std::string text = json.toStyledString();
  EXPECT_EQ(std::string::npos, text.find(entry.get_protect_password()));
  EXPECT_EQ(std::string::npos, text.find(entry.get_protect_password_salt()));
  EXPECT_EQ(std::string::npos, text.find("hidden"));
  EXPECT_EQ("password", json["protect_type"].asString());
}

TEST(EntryJson, ShowsUnknownKindsAsNone) {
  const std::map<int, std::string> protections = {
      {0, "none"}, {1, "password"}, {2, "user"}, {3, "none"}};
  for (const auto &[number, text] : protections) {
    Json::Value json;
    Entry().set_protect_type(static_cast<Entry::ProtectType>(number)).ToJSON(json);
    EXPECT_EQ(text, json["protect_type"].asString());
  }
  const std::map<int, std::string> redirects = {
      {0, "none"}, {1, "url_param"}, {2, "always"}, {3, "none"}};
  for (const auto &[number, text] : redirects) {
    Json::Value json;
    Entry().set_redirect_type(static_cast<Entry::RedirectType>(number)).ToJSON(json);
    EXPECT_EQ(text, json["redirect_type"].asString());
  }
}

}  // namespace
