#include <gtest/gtest.h>
#include <json/reader.h>
#include <velksharing/constants.h>
#include <velksharing/record.h>

#include <atomic>
#include <climits>
#include <memory>
#include <sstream>
#include <thread>
#include <utility>
#include <vector>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/sample_records.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::record::Object;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::SampleEntry;
using velk_test::SampleRow;

using EntryRecord = VELK::sharing::record::Entry;

constexpr size_t data_column = 9;

Json::Value Parsed(const std::string &text) {
  std::istringstream stream(text);
  Json::Value value;
  std::string errors;
  EXPECT_TRUE(Json::parseFromStream(Json::CharReaderBuilder(), stream, &value, &errors)) << errors;
  return value;
}

Json::Value DataOf(const EntryRecord &entry) {
  return Parsed(entry.GetFieldList().at(data_column));
}

/// The columns of a link that loads, with this text as its data.
std::map<std::string, std::string> ColumnsWith(const std::string &data) {
  return {{"id", "7"},        {"hash", "aB3xK9pQ2"}, {"project_name", "photo"},
          {"enabled", "1"},   {"owner_uid", "1026"}, {"start_at", "0"},
          {"expire_at", "0"}, {"expire_times", "0"}, {"use_count", "0"},
          {"auto_gc", "1"},   {"data", data}};
}

bool Loads(EntryRecord &entry, const std::map<std::string, std::string> &columns) {
  const SampleRow row(columns);
  EXPECT_TRUE(row.good());
  return entry.FromRow(row.row());
}

bool LoadsData(EntryRecord &entry, const std::string &data) {
  const LogCapture quiet;
  return Loads(entry, ColumnsWith(data));
}

/// A link with a value of its own in every field.
EntryRecord Full() {
  EntryRecord entry;
  entry.set_id(7).set_hash("aB3xK9pQ2").set_project_name("photo").set_enabled(false);
  entry.set_owner_uid(1026).set_start_at(1600000000).set_expire_at(1700000000);
  entry.set_expire_times(5).set_use_count(3).set_auto_gc(false).set_enable_match_ip(false);
  entry.set_protect_type(EntryRecord::PROTECT_PASSWORD).set_protect_title("Family");
  entry.set_protect_password("secret", true, EntryRecord::ENCRYPT_ALGO_DEFAULT);
  entry.set_protect_users({"root", "velk-no-such-user"});
  entry.set_protect_groups({"root", "velk-no-such-group"});
  entry.set_redirect_type(EntryRecord::REDIRECT_ALWAYS).set_redirect_uri("/photo");
  entry.set_app(Parsed(R"({"path":"/volume1/photo","depth":[1,{"a":null}]})"));
  entry.set_private_data(Parsed(R"({"note":"private"})"));
  return entry;
}

TEST(Entry, IsAnOpenLinkByDefault) {
  const EntryRecord entry;
  EXPECT_EQ(0, entry.get_id());
  EXPECT_EQ("", entry.get_hash());
  EXPECT_EQ("", entry.get_project_name());
  EXPECT_TRUE(entry.get_enabled());
  EXPECT_EQ(4294967295u, entry.get_owner_uid());
  EXPECT_EQ(0, entry.get_start_at());
  EXPECT_EQ(0, entry.get_expire_at());
  EXPECT_EQ(0, entry.get_expire_times());
  EXPECT_EQ(0, entry.get_use_count());
  EXPECT_TRUE(entry.get_auto_gc());
  EXPECT_TRUE(entry.get_enable_match_ip());
  EXPECT_EQ(EntryRecord::PROTECT_NONE, entry.get_protect_type());
  EXPECT_EQ("", entry.get_protect_title());
  EXPECT_EQ("", entry.get_protect_password());
  EXPECT_EQ("", entry.get_protect_password_salt());
  EXPECT_EQ(EntryRecord::ENCRYPT_ALGO_DEFAULT, entry.get_protect_password_algo());
  EXPECT_THAT(entry.get_protect_uids(), IsEmpty());
  EXPECT_THAT(entry.get_protect_gids(), IsEmpty());
  EXPECT_THAT(entry.get_protect_users(), IsEmpty());
  EXPECT_THAT(entry.get_protect_groups(), IsEmpty());
  EXPECT_EQ(EntryRecord::REDIRECT_NONE, entry.get_redirect_type());
  EXPECT_EQ("", entry.get_redirect_uri());
  EXPECT_TRUE(entry.get_app().isNull());
  EXPECT_EQ(Json::Value(Json::objectValue), entry.get_private_data());
}

TEST(Entry, GivesTheEnumerationsTheirNumbers) {
  EXPECT_EQ(0, EntryRecord::PROTECT_NONE);
  EXPECT_EQ(1, EntryRecord::PROTECT_PASSWORD);
  EXPECT_EQ(2, EntryRecord::PROTECT_USER);
  EXPECT_EQ(0, EntryRecord::REDIRECT_NONE);
  EXPECT_EQ(1, EntryRecord::REDIRECT_URLPARAM);
  EXPECT_EQ(2, EntryRecord::REDIRECT_ALWAYS);
  EXPECT_EQ(0, EntryRecord::ENCRYPT_ALGO_DEFAULT);
  EXPECT_EQ(1, EntryRecord::ENCRYPT_ALGO_MD5);
}

TEST(Entry, SettersChainAndKeepTheirValues) {
  EntryRecord entry;
  EXPECT_EQ(
      &entry,
      &entry.set_id(1).set_hash("h").set_project_name("p").set_enabled(false).set_owner_uid(2));
  EXPECT_EQ(&entry, &entry.set_start_at(3).set_expire_at(4).set_use_count(5).set_auto_gc(false));
  EXPECT_EQ(&entry, &entry.set_enable_match_ip(false).set_protect_title("t").set_redirect_uri("u"));
  EXPECT_EQ(&entry, &entry.set_protect_type(EntryRecord::PROTECT_USER)
                         .set_redirect_type(EntryRecord::REDIRECT_URLPARAM));
  EXPECT_EQ(&entry, &entry.set_app(1).set_private_data("x").set_expire_times(6).inc_use_count());
  EXPECT_EQ(&entry, &entry.set_owner_user("velk-no-such-user")
                         .set_start_at_str("", "%Y")
                         .set_expire_at_str("", "%Y")
                         .set_protect_uids({})
                         .set_protect_gids({})
                         .set_protect_users({})
                         .set_protect_groups({})
                         .set_protect_password("p", true, EntryRecord::ENCRYPT_ALGO_MD5));
  EXPECT_EQ(1, entry.get_id());
  EXPECT_EQ("h", entry.get_hash());
  EXPECT_EQ("p", entry.get_project_name());
  EXPECT_FALSE(entry.get_enabled());
  EXPECT_FALSE(entry.get_auto_gc());
  EXPECT_FALSE(entry.get_enable_match_ip());
  EXPECT_EQ("t", entry.get_protect_title());
  EXPECT_EQ("u", entry.get_redirect_uri());
  EXPECT_EQ(EntryRecord::PROTECT_USER, entry.get_protect_type());
  EXPECT_EQ(EntryRecord::REDIRECT_URLPARAM, entry.get_redirect_type());
  EXPECT_EQ(Json::Value(1), entry.get_app());
  EXPECT_EQ(Json::Value("x"), entry.get_private_data());
}

TEST(Entry, WritesTheColumnsOfADefaultLink) {
  const std::vector<std::string> list = EntryRecord().GetFieldList();
  ASSERT_EQ(10u, list.size());
  EXPECT_THAT(std::vector<std::string>(list.begin(), list.begin() + data_column),
              ElementsAre("", "", "1", "4294967295", "0", "0", "0", "0", "1"));
}

TEST(Entry, WritesTheDataOfADefaultLink) {
  const Json::Value expected = Parsed(R"({
    "enable_match_ip": true, "protect_type": "none", "protect_title": "",
    "protect_password": "", "protect_password_algo": "default", "protect_password_salt": "",
    "protect_uids": [], "protect_extra_users": [], "protect_gids": [], "protect_extra_groups": [],
    "redirect_type": "none", "redirect_uri": "", "app": null, "private_data": {}})");
  EXPECT_EQ(expected, DataOf(EntryRecord()));
}

TEST(Entry, WritesEveryColumnOfAFullLink) {
  const std::vector<std::string> list = Full().GetFieldList();
  EXPECT_THAT(
      std::vector<std::string>(list.begin(), list.begin() + data_column),
      ElementsAre("aB3xK9pQ2", "photo", "0", "1026", "1600000000", "1700000000", "5", "3", "0"));
}

TEST(Entry, WritesEveryMemberOfTheData) {
  const EntryRecord entry = Full();
  const Json::Value data = DataOf(entry);
  EXPECT_EQ(14u, data.size());
  EXPECT_EQ(Json::Value(false), data["enable_match_ip"]);
  EXPECT_EQ("password", data["protect_type"].asString());
  EXPECT_EQ("Family", data["protect_title"].asString());
  EXPECT_EQ(entry.get_protect_password(), data["protect_password"].asString());
  EXPECT_EQ("default", data["protect_password_algo"].asString());
  EXPECT_EQ(entry.get_protect_password_salt(), data["protect_password_salt"].asString());
  EXPECT_EQ(Parsed("[0]"), data["protect_uids"]);
  EXPECT_EQ(Parsed(R"(["velk-no-such-user"])"), data["protect_extra_users"]);
  EXPECT_EQ(Parsed("[0]"), data["protect_gids"]);
  EXPECT_EQ(Parsed(R"(["velk-no-such-group"])"), data["protect_extra_groups"]);
  EXPECT_EQ("always", data["redirect_type"].asString());
  EXPECT_EQ("/photo", data["redirect_uri"].asString());
  EXPECT_EQ(entry.get_app(), data["app"]);
  EXPECT_EQ(entry.get_private_data(), data["private_data"]);
}

TEST(Entry, WritesTheDataOnOneLine) {
  EXPECT_EQ(std::string::npos, Full().GetFieldList().at(data_column).find('\n'));
}

TEST(Entry, WritesLargeIdsUnsigned) {
  EntryRecord entry;
  entry.set_owner_uid(4294967294u).set_protect_uids({4294967295u, 0});
  EXPECT_EQ("4294967294", entry.GetFieldList().at(3));
  EXPECT_EQ(4294967295u, DataOf(entry)["protect_uids"][0].asUInt());
}

TEST(Entry, WritesNegativeAndLateTimes) {
  EntryRecord entry;
  entry.set_start_at(-5).set_expire_at(5000000000L);
  EXPECT_EQ("-5", entry.GetFieldList().at(4));
  EXPECT_EQ("5000000000", entry.GetFieldList().at(5));
}

TEST(Entry, NamesItsColumns) {
  const EntryRecord entry = Full();
  const std::vector<std::string> names = {"hash",     "project_name", "enabled",      "owner_uid",
                                          "start_at", "expire_at",    "expire_times", "use_count",
                                          "auto_gc",  "data"};
  const std::vector<std::string> list = entry.GetFieldList();
  const std::map<std::string, std::string> map = entry.GetFieldMap();
  ASSERT_EQ(names.size(), list.size());
  ASSERT_EQ(names.size(), map.size());
  for (size_t i = 0; i < names.size(); ++i) EXPECT_EQ(list[i], map.at(names[i])) << names[i];
}

TEST(Entry, WritesEveryKindOfProtection) {
  EntryRecord entry;
  const std::map<int, std::string> expected = {
      {0, "none"}, {1, "password"}, {2, "user"}, {3, "user"}};
  for (const auto &[number, text] : expected) {
    entry.set_protect_type(static_cast<EntryRecord::ProtectType>(number));
    EXPECT_EQ(text, DataOf(entry)["protect_type"].asString());
  }
}

TEST(Entry, WritesEveryKindOfRedirect) {
  EntryRecord entry;
  const std::map<int, std::string> expected = {
      {0, "none"}, {1, "url_param"}, {2, "always"}, {3, "always"}};
  for (const auto &[number, text] : expected) {
    entry.set_redirect_type(static_cast<EntryRecord::RedirectType>(number));
    EXPECT_EQ(text, DataOf(entry)["redirect_type"].asString());
  }
}

TEST(Entry, WritesEveryPasswordAlgorithm) {
  EntryRecord entry;
  const std::map<int, std::string> expected = {{0, "default"}, {1, "md5"}};
  for (const auto &[number, text] : expected) {
    entry.set_protect_password("x", false, static_cast<EntryRecord::PasswordEncryptAlgo>(number));
    EXPECT_EQ(text, DataOf(entry)["protect_password_algo"].asString());
  }
}

TEST(Entry, StartsTheUseCountAnewWhenALimitIsIntroduced) {
  EntryRecord entry;
  entry.set_use_count(3).set_expire_times(5);
  EXPECT_EQ(0, entry.get_use_count());
  EXPECT_EQ(5, entry.get_expire_times());
}

TEST(Entry, StartsTheUseCountAnewForANegativeLimitToo) {
  EXPECT_EQ(0, EntryRecord().set_use_count(3).set_expire_times(-1).get_use_count());
}

TEST(Entry, KeepsTheUseCountWhenALimitChanges) {
  EntryRecord entry;
  entry.set_expire_times(2).set_use_count(3).set_expire_times(5);
  EXPECT_EQ(3, entry.get_use_count());
  entry.set_expire_times(0);
  EXPECT_EQ(3, entry.get_use_count());
  EXPECT_EQ(0, entry.get_expire_times());
}

TEST(Entry, KeepsTheUseCountWhenNoLimitStaysNoLimit) {
  EXPECT_EQ(3, EntryRecord().set_use_count(3).set_expire_times(0).get_use_count());
}

TEST(Entry, KeepsTheUseCountWhenTheOldLimitWasNegative) {
  EXPECT_EQ(
      3, EntryRecord().set_expire_times(-1).set_use_count(3).set_expire_times(5).get_use_count());
}

TEST(Entry, CountsUsesBeyondTheLimit) {
  EntryRecord entry;
  entry.set_expire_times(5).set_use_count(5).inc_use_count();
  EXPECT_EQ(6, entry.get_use_count());
}

TEST(Entry, StopsCountingAtTheLargestNumber) {
  EXPECT_EQ(INT_MAX, EntryRecord().set_use_count(INT_MAX).inc_use_count().get_use_count());
}

TEST(Entry, LoadsWhatItWrote) {
  EntryRecord entry = Full();
  std::map<std::string, std::string> columns = entry.GetFieldMap();
  columns["id"] = "7";
  EntryRecord loaded;
  EXPECT_TRUE(Loads(loaded, columns));
  EXPECT_EQ(7, loaded.get_id());
  EXPECT_EQ(entry.GetFieldMap(), loaded.GetFieldMap());
}

TEST(Entry, LoadsThePlainColumns) {
  std::map<std::string, std::string> columns = ColumnsWith(R"({"protect_type":"none","app":{}})");
  columns["enabled"] = "0";
  columns["start_at"] = "-5";
  columns["expire_at"] = "5000000000";
  columns["expire_times"] = "3";
  columns["use_count"] = "2";
  EntryRecord entry;
  EXPECT_TRUE(Loads(entry, columns));
  EXPECT_EQ(7, entry.get_id());
  EXPECT_EQ("aB3xK9pQ2", entry.get_hash());
  EXPECT_EQ("photo", entry.get_project_name());
  EXPECT_FALSE(entry.get_enabled());
  EXPECT_EQ(1026u, entry.get_owner_uid());
  EXPECT_EQ(-5, entry.get_start_at());
  EXPECT_EQ(5000000000L, entry.get_expire_at());
  EXPECT_EQ(3, entry.get_expire_times());
  EXPECT_EQ(2, entry.get_use_count());
  EXPECT_TRUE(entry.get_auto_gc());
}

TEST(Entry, ReadsAnyNumberButZeroAsAutomaticRemoval) {
  const std::map<std::string, bool> expected = {{"0", false}, {"1", true}, {"2", true},
                                                {"-1", true}, {"", false}, {"yes", false}};
  for (const auto &[text, automatic] : expected) {
    std::map<std::string, std::string> columns = ColumnsWith(R"({"protect_type":"none","app":{}})");
    columns["auto_gc"] = text;
    EntryRecord entry;
    EXPECT_TRUE(Loads(entry, columns));
    EXPECT_EQ(automatic, entry.get_auto_gc()) << text;
  }
}

TEST(Entry, ReadsOnlyOneAsEnabled) {
  for (const char *text : {"2", "yes", "", "-1"}) {
    std::map<std::string, std::string> columns = ColumnsWith(R"({"protect_type":"none","app":{}})");
    columns["enabled"] = text;
    EntryRecord entry;
    EXPECT_TRUE(Loads(entry, columns));
    EXPECT_FALSE(entry.get_enabled()) << text;
  }
}

TEST(Entry, LoadsAnOwnerThatIsNoNumberAsNone) {
  std::map<std::string, std::string> columns = ColumnsWith(R"({"protect_type":"none","app":{}})");
  columns["owner_uid"] = "ann";
  const LogCapture log;
  EntryRecord entry;
  EXPECT_FALSE(Loads(entry, columns));
  EXPECT_EQ(4294967295u, entry.get_owner_uid());
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition("entry", "UID_ERR == owner_uid_")));
}

TEST(Entry, LoadsDefaultsForMissingMembers) {
  EntryRecord entry = Full();
  EXPECT_TRUE(LoadsData(entry, R"({"protect_type":"none","app":{"a":1}})"));
  EXPECT_FALSE(entry.get_enable_match_ip());
  EXPECT_EQ("", entry.get_protect_title());
  EXPECT_EQ("", entry.get_protect_password());
  EXPECT_EQ("", entry.get_protect_password_salt());
  EXPECT_EQ(EntryRecord::ENCRYPT_ALGO_MD5, entry.get_protect_password_algo());
  EXPECT_THAT(entry.get_protect_users(), IsEmpty());
  EXPECT_THAT(entry.get_protect_groups(), IsEmpty());
  EXPECT_EQ(EntryRecord::REDIRECT_ALWAYS, entry.get_redirect_type());
  EXPECT_EQ("", entry.get_redirect_uri());
  EXPECT_EQ(Parsed(R"({"a":1})"), entry.get_app());
  EXPECT_EQ(Json::Value(Json::objectValue), entry.get_private_data());
}

TEST(Entry, LoadsAMissingProtectionAsTheStrictest) {
  const LogCapture log;
  EntryRecord entry;
  EXPECT_FALSE(Loads(entry, ColumnsWith(R"({"app":{}})")));
  EXPECT_EQ(EntryRecord::PROTECT_USER, entry.get_protect_type());
  EXPECT_THAT(log.lines(),
              ElementsAre(FailedCondition(
                  "entry",
                  "Entry::PROTECT_USER == protect_type_ && (0 == protect_uids_.size() + "
                  "protect_extra_users_.size() + protect_gids_.size() + "
                  "protect_extra_groups_.size())")));
}

TEST(Entry, LoadsEveryTextOfProtection) {
  const std::map<std::string, EntryRecord::ProtectType> expected = {
      {"none", EntryRecord::PROTECT_NONE}, {"password", EntryRecord::PROTECT_PASSWORD},
      {"user", EntryRecord::PROTECT_USER}, {"None", EntryRecord::PROTECT_USER},
      {"", EntryRecord::PROTECT_USER},     {"other", EntryRecord::PROTECT_USER}};
  for (const auto &[text, type] : expected) {
    EntryRecord entry;
    EXPECT_TRUE(LoadsData(
        entry,
        R"({"app":{},"protect_uids":[1],"protect_password":"d","protect_type":")" + text + "\"}"));
    EXPECT_EQ(type, entry.get_protect_type()) << text;
  }
}

TEST(Entry, LoadsEveryTextOfRedirection) {
  const std::map<std::string, EntryRecord::RedirectType> expected = {
      {"none", EntryRecord::REDIRECT_NONE},
      {"url_param", EntryRecord::REDIRECT_URLPARAM},
      {"always", EntryRecord::REDIRECT_ALWAYS},
      {"other", EntryRecord::REDIRECT_ALWAYS},
      {"", EntryRecord::REDIRECT_ALWAYS}};
  for (const auto &[text, type] : expected) {
    EntryRecord entry;
    EXPECT_TRUE(
        LoadsData(entry, R"({"app":{},"protect_type":"none","redirect_type":")" + text + "\"}"));
    EXPECT_EQ(type, entry.get_redirect_type()) << text;
  }
}

TEST(Entry, LoadsEveryTextOfAnAlgorithm) {
  const std::map<std::string, EntryRecord::PasswordEncryptAlgo> expected = {
      {"default", EntryRecord::ENCRYPT_ALGO_DEFAULT},
      {"md5", EntryRecord::ENCRYPT_ALGO_MD5},
      {"sha512", EntryRecord::ENCRYPT_ALGO_MD5},
      {"", EntryRecord::ENCRYPT_ALGO_MD5}};
  for (const auto &[text, algo] : expected) {
    EntryRecord entry;
    EXPECT_TRUE(LoadsData(
        entry, R"({"app":{},"protect_type":"none","protect_password_algo":")" + text + "\"}"));
    EXPECT_EQ(algo, entry.get_protect_password_algo()) << text;
  }
}

TEST(Entry, LoadsTheListsInTheirOrder) {
  EntryRecord entry = Full();
  EXPECT_TRUE(LoadsData(entry, R"({"app":{},"protect_type":"user","protect_uids":[4294967295,3,3],
      "protect_extra_users":["zoe","ann"],"protect_gids":[9,8],"protect_extra_groups":["b","a"]})"));
  const Json::Value data = DataOf(entry);
  EXPECT_EQ(Parsed("[4294967295,3,3]"), data["protect_uids"]);
  EXPECT_EQ(Parsed(R"(["zoe","ann"])"), data["protect_extra_users"]);
  EXPECT_EQ(Parsed("[9,8]"), data["protect_gids"]);
  EXPECT_EQ(Parsed(R"(["b","a"])"), data["protect_extra_groups"]);
}

TEST(Entry, LoadsTheSameDataAnewForEachRecord) {
  const std::string data =
      R"({"protect_type":"none","protect_title":"Family","app":{"path":"/a"}})";
  for (int turn = 0; turn < 5; ++turn) {
    EntryRecord entry;
    ASSERT_TRUE(LoadsData(entry, data));
    EXPECT_EQ("Family", entry.get_protect_title());
    Json::Value app = entry.get_app();
    EXPECT_EQ("/a", app["path"].asString());
    app["path"] = "/b";
    entry.set_app(app).set_protect_title("Work");
  }
}

TEST(Entry, LoadsKnownDataIntoARecordThatHeldOther) {
  const std::string data = R"({"protect_type":"none","app":{"path":"/a"}})";
  for (int turn = 0; turn < 4; ++turn) {
    EntryRecord entry = Full();
    ASSERT_TRUE(LoadsData(entry, data));
    EXPECT_EQ(EntryRecord::PROTECT_NONE, entry.get_protect_type());
    EXPECT_EQ("", entry.get_protect_title());
    EXPECT_EQ("", entry.get_redirect_uri());
    EXPECT_THAT(entry.get_protect_uids(), IsEmpty());
    EXPECT_EQ("/a", entry.get_app()["path"].asString());
  }
}

TEST(Entry, RefusesBrokenDataEachTime) {
  for (int turn = 0; turn < 4; ++turn) {
    EntryRecord entry;
    EXPECT_FALSE(LoadsData(entry, R"({"protect_type":"none","app":{},"protect_title":5})"));
  }
}

TEST(Entry, LoadsManyDifferentDataMoreThanOnce) {
  const auto title = [](int number) { return "Title " + std::to_string(number % 50); };
  for (int number = 0; number < 150; ++number) {
    const std::string data =
        R"({"protect_type":"none","app":{},"protect_title":")" + title(number) + "\"}";
    for (int turn = 0; turn < 3; ++turn) {
      EntryRecord entry;
      ASSERT_TRUE(LoadsData(entry, data));
      EXPECT_EQ(title(number), entry.get_protect_title());
    }
  }
}

TEST(Entry, LoadsLargeDataMoreThanOnce) {
  const std::string title(100'000, 'x');
  for (int turn = 0; turn < 4; ++turn) {
    EntryRecord entry;
    const std::string data = R"({"protect_type":"none","app":{},"protect_title":")" + title + "\"}";
    ASSERT_TRUE(LoadsData(entry, data));
    EXPECT_EQ(title, entry.get_protect_title());
  }
}

TEST(Entry, LoadsInSeveralThreadsAtOnce) {
  std::atomic<int> wrong = 0;
  const auto load = [&](int first) {
    for (int number = first; number < first + 1000; ++number) {
      const std::string title = std::to_string(number / 3 % 30);
      EntryRecord entry;
      const bool is_loaded = Loads(
          entry,
          ColumnsWith(R"({"protect_type":"none","app":{},"protect_title":")" + title + "\"}"));
      if (!is_loaded || entry.get_protect_title() != title) ++wrong;
    }
  };
  std::vector<std::thread> threads;
  for (int first = 0; first < 4; ++first) threads.emplace_back(load, first);
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(0, wrong);
}

TEST(Entry, RefusesDataThatIsNoJson) {
  for (const char *data : {"", "{", "nonsense", "{\"app\":}", "{\"app\":{}", "\x01"}) {
    EntryRecord entry;
    EXPECT_FALSE(LoadsData(entry, data)) << data;
  }
}

TEST(Entry, KeepsTheRestWhenTheDataIsNoJson) {
  EntryRecord entry = Full();
  EXPECT_FALSE(LoadsData(entry, "nonsense"));
  EXPECT_TRUE(entry.get_enabled()) << "the plain columns are loaded before the data";
  EXPECT_EQ("Family", entry.get_protect_title());
  EXPECT_EQ("/photo", entry.get_redirect_uri());
}

TEST(Entry, RefusesDataThatIsNoObject) {
  for (const char *data : {"[]", "[1,2]", "5", "-1.5", "\"text\"", "null", "true"}) {
    EntryRecord entry = SampleEntry("h");
    EXPECT_NO_THROW(EXPECT_FALSE(LoadsData(entry, data)) << data);
  }
}

TEST(Entry, RefusesMembersOfTheWrongType) {
  const std::vector<std::string> members = {R"("enable_match_ip":"yes")",
                                            R"("enable_match_ip":[])",
                                            R"("enable_match_ip":{})",
                                            R"("protect_type":[])",
                                            R"("protect_type":{"a":1})",
                                            R"("protect_title":{})",
                                            R"("protect_title":["x"])",
                                            R"("protect_password":[])",
                                            R"("protect_password_algo":{})",
                                            R"("protect_password_salt":[])",
                                            R"("protect_uids":"1")",
                                            R"("protect_uids":5)",
                                            R"("protect_uids":["x"])",
                                            R"("protect_uids":[-1])",
                                            R"("protect_uids":[4294967296])",
                                            R"("protect_uids":[[1]])",
                                            R"("protect_uids":[{}])",
                                            R"("protect_uids":true)",
                                            R"("protect_extra_users":"ann")",
                                            R"("protect_extra_users":[[]])",
                                            R"("protect_extra_users":[{}])",
                                            R"("protect_gids":["x"])",
                                            R"("protect_gids":[-5])",
                                            R"("protect_gids":"x")",
                                            R"("protect_extra_groups":[{}])",
                                            R"("protect_extra_groups":3)",
                                            R"("redirect_type":[])",
                                            R"("redirect_uri":{})",
                                            R"("private_data":[])",
                                            R"("private_data":null)",
                                            R"("private_data":"x")",
                                            R"("app":[])",
                                            R"("app":"x")",
                                            R"("app":null)"};
  for (const std::string &member : members) {
    EntryRecord entry;
    const bool loads_without = LoadsData(entry, R"({"app":{},"protect_type":"none"})");
    ASSERT_TRUE(loads_without);
    const std::string data = member.find("\"app\"") == 0
                                 ? R"({"protect_type":"none",)" + member + "}"
                                 : R"({"app":{},"protect_type":"none",)" + member + "}";
    EXPECT_NO_THROW(EXPECT_FALSE(LoadsData(entry, data)) << data);
  }
}

TEST(Entry, RefusesDataThatIsNestedTooDeep) {
  const std::string open(2000, '[');
  const std::string close(2000, ']');
  EntryRecord entry;
  EXPECT_NO_THROW(EXPECT_FALSE(
      LoadsData(entry, R"({"protect_type":"none","app":{"a":)" + open + close + "}}")));
}

TEST(Entry, RefusesDataThatIsNestedAMillionTimes) {
  EntryRecord entry;
  EXPECT_NO_THROW(EXPECT_FALSE(
      LoadsData(entry, R"({"protect_type":"none","app":{"a":)" + std::string(1000000, '['))));
}

TEST(Entry, LoadsCommentsInTheData) {
  EntryRecord entry;
  EXPECT_TRUE(LoadsData(entry, R"(/* a */ {"app":{"x":1 /* b */},"protect_type":"none"} // c)"));
  EXPECT_EQ(1, entry.get_app()["x"].asInt());
  EntryRecord again;
  EXPECT_TRUE(LoadsData(again, entry.GetFieldList().at(data_column)));
  EXPECT_EQ(1, again.get_app()["x"].asInt());
}

TEST(Entry, KeepsBytesThatAreNoUtf8) {
  std::string bytes;
  for (int byte = 1; byte < 256; ++byte) bytes.push_back(static_cast<char>(byte));
  bytes += "\xc3\xa4 \xe2\x82\xac \xf0\x9f\x98\x80 \xed\xa0\x80 \xc0\x80";
  EntryRecord entry = SampleEntry(bytes);
  entry.set_project_name(bytes).set_protect_title(bytes).set_redirect_uri(bytes);
  entry.set_protect_users({bytes});
  Json::Value app(Json::objectValue);
  app[bytes] = bytes;
  entry.set_app(app);

  std::map<std::string, std::string> columns = entry.GetFieldMap();
  columns["id"] = "7";
  EntryRecord loaded;
  ASSERT_TRUE(Loads(loaded, columns));

  EXPECT_EQ(bytes, loaded.get_hash());
  EXPECT_EQ(bytes, loaded.get_project_name());
  EXPECT_EQ(bytes, loaded.get_protect_title());
  EXPECT_EQ(bytes, loaded.get_redirect_uri());
  EXPECT_THAT(loaded.get_protect_users(), ElementsAre(bytes));
  EXPECT_EQ(app, loaded.get_app());
}

TEST(Entry, KeepsZeroBytesInsideTheData) {
  EntryRecord entry;
  ASSERT_TRUE(LoadsData(
      entry, R"({"app":{"k":"a\u0000b"},"protect_type":"none","protect_title":"c\u0000d"})"));
  EXPECT_EQ(std::string("c\0d", 3), entry.get_protect_title());
  EXPECT_EQ(std::string("a\0b", 3), entry.get_app()["k"].asString());

  EntryRecord again;
  ASSERT_TRUE(LoadsData(again, entry.GetFieldList().at(data_column)));
  EXPECT_EQ(std::string("c\0d", 3), again.get_protect_title());
  EXPECT_EQ(std::string("a\0b", 3), again.get_app()["k"].asString());
}

TEST(Entry, KeepsNumbersOfTheApplicationExactly) {
  EntryRecord entry = SampleEntry("h");
  entry.set_app(
      Parsed(R"({"large":18446744073709551615,"small":-9223372036854775808,"real":0.1})"));
  EntryRecord loaded;
  ASSERT_TRUE(LoadsData(loaded, entry.GetFieldList().at(data_column)));
  EXPECT_EQ(entry.get_app(), loaded.get_app());
}

TEST(Entry, KeepsTenMegabytesOfTheApplication) {
  EntryRecord entry = SampleEntry("h");
  Json::Value app(Json::objectValue);
  app["large"] = std::string(10u << 20, '\'');
  entry.set_app(app);
  std::map<std::string, std::string> columns = entry.GetFieldMap();
  EntryRecord loaded;
  ASSERT_TRUE(Loads(loaded, columns));
  EXPECT_TRUE(app == loaded.get_app());
}

TEST(Entry, IsTheObjectThatItHandsOut) {
  EntryRecord entry = Full();
  Object &object = entry.GetObject();
  EXPECT_EQ(&object, &entry.GetCObject());
  EXPECT_EQ(entry.GetFieldList(), object.GetFieldList());
  EXPECT_EQ(entry.GetFieldMap(), object.GetFieldMap());
  EXPECT_TRUE(object.IsLegal());
  object.set_id(33);
  EXPECT_EQ(33, entry.get_id());
}

TEST(Entry, CopiesAreIndependent) {
  const EntryRecord entry = Full();
  EntryRecord copy(entry);
  EntryRecord assigned = SampleEntry("other");
  assigned = entry;
  for (EntryRecord *other : {&copy, &assigned}) {
    EXPECT_EQ(7, other->get_id());
    EXPECT_EQ(entry.GetFieldList(), other->GetFieldList());
    other->set_hash("changed").set_protect_uids({1, 2, 3}).set_app(Json::Value());
    EXPECT_EQ(Full().get_hash(), entry.get_hash());
    EXPECT_EQ(Parsed("[0]"), DataOf(entry)["protect_uids"]);
    EXPECT_EQ(Full().get_app(), entry.get_app());
  }
}

TEST(Entry, CopiesCarryAFailedPasswordAlong) {
  EntryRecord entry = SampleEntry("h");
  entry.set_protect_password("", true, EntryRecord::ENCRYPT_ALGO_MD5);
  const LogCapture quiet;
  EXPECT_FALSE(EntryRecord(entry).IsLegal());
  EntryRecord assigned = SampleEntry("other");
  assigned = entry;
  EXPECT_FALSE(assigned.IsLegal());
  const EntryRecord moved(std::move(entry));
  EXPECT_FALSE(moved.IsLegal());
}

TEST(Entry, MoveConstructionTakesTextsAndListsAndCopiesTheRest) {
  EntryRecord entry = Full();
  const EntryRecord before(entry);
  const EntryRecord moved(std::move(entry));

  EXPECT_EQ(7, moved.get_id());
  EXPECT_EQ(before.GetFieldList(), moved.GetFieldList());

  EXPECT_EQ("", entry.get_hash());
  EXPECT_EQ("", entry.get_project_name());
  EXPECT_EQ("", entry.get_protect_title());
  EXPECT_EQ("", entry.get_protect_password());
  EXPECT_EQ("", entry.get_protect_password_salt());
  EXPECT_EQ("", entry.get_redirect_uri());
  const Json::Value data = DataOf(entry);
  for (const char *list :
       {"protect_uids", "protect_extra_users", "protect_gids", "protect_extra_groups"})
    EXPECT_TRUE(data[list].empty()) << list;

  EXPECT_EQ(7, entry.get_id());
  EXPECT_EQ(1026u, entry.get_owner_uid());
  EXPECT_EQ(1600000000, entry.get_start_at());
  EXPECT_EQ(5, entry.get_expire_times());
  EXPECT_EQ(EntryRecord::PROTECT_PASSWORD, entry.get_protect_type());
  EXPECT_EQ(EntryRecord::REDIRECT_ALWAYS, entry.get_redirect_type());
  EXPECT_EQ(before.get_app(), entry.get_app());
  EXPECT_EQ(before.get_private_data(), entry.get_private_data());
}

TEST(Entry, MoveAssignmentSwapsTextsTakesListsAndCopiesTheRest) {
  EntryRecord entry = Full();
  const EntryRecord before(entry);
  EntryRecord target = SampleEntry("old hash");
  target.set_project_name("old project").set_protect_title("old title");
  target.set_redirect_uri("old uri").set_app(Parsed(R"({"old":1})"));
  target.set_protect_users({"root", "velk-old-user"})
      .set_protect_groups({"root", "velk-old-group"});
  target.set_protect_password("old digest", false, EntryRecord::ENCRYPT_ALGO_MD5);
  target = std::move(entry);

  EXPECT_EQ(7, target.get_id());
  EXPECT_EQ(before.GetFieldList(), target.GetFieldList());

  EXPECT_EQ("old hash", entry.get_hash());
  EXPECT_EQ("old project", entry.get_project_name());
  EXPECT_EQ("old title", entry.get_protect_title());
  EXPECT_EQ("old digest", entry.get_protect_password());
  EXPECT_EQ("", entry.get_protect_password_salt());
  EXPECT_EQ("old uri", entry.get_redirect_uri());
  const Json::Value data = DataOf(entry);
  for (const char *list :
       {"protect_uids", "protect_extra_users", "protect_gids", "protect_extra_groups"})
    EXPECT_TRUE(data[list].empty()) << list;
  EXPECT_EQ(7, entry.get_id());
  EXPECT_EQ(before.get_app(), entry.get_app());
  EXPECT_EQ(before.get_private_data(), entry.get_private_data());
}

TEST(Entry, StaysUsableAfterAMove) {
  EntryRecord entry = SampleEntry("h");
  const EntryRecord moved(std::move(entry));
  entry.set_hash("again").set_project_name("photo");
  EXPECT_TRUE(entry.IsLegal());
  entry = SampleEntry("assigned");
  EXPECT_EQ("assigned", entry.get_hash());
}

TEST(Entry, SurvivesAssignmentToItself) {
  EntryRecord entry = Full();
  const std::vector<std::string> before = entry.GetFieldList();
  EntryRecord &same = entry;
  entry = same;
  EXPECT_EQ(before, entry.GetFieldList());
  entry = std::move(same);
  EXPECT_EQ("aB3xK9pQ2", entry.get_hash());
}

}  // namespace
