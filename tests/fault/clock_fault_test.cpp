#include <gtest/gtest.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <cstdlib>

#include "fault/platform_override.h"
#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::ElementsAre;
using VELK::sharing::UID_ERR;
using VELK::sharing::db::BaseDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using VELK::sharing::record::Token;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
using velk_test::RawDatabase;

constexpr long now = 1700000000;

/// A clock that stands still, so that single seconds can be told apart.
class StoppedClock : public ::testing::Test {
 protected:
  StoppedClock() { SetClock(now); }

  static void SetClock(time_t moment) {
    Overrides().clock = [moment] { return moment; };
  }

  static Entry Link(const std::string &hash) { return velk_test::SampleEntry(hash); }

  const OverrideScope scope_;
};

TEST_F(StoppedClock, ALinkIsValidUpToAndIncludingItsLastSecond) {
  const LogCapture log;
  EXPECT_TRUE(Link("h").set_expire_at(now).IsValid());
  EXPECT_FALSE(Link("h").set_expire_at(now - 1).IsValid());
  EXPECT_THAT(log.lines(),
              ElementsAre(FailedCondition("entry", "0 < expire_at_ && timeNow > expire_at_")));
}

TEST_F(StoppedClock, ALinkIsValidFromItsFirstSecondOn) {
  const LogCapture log;
  EXPECT_TRUE(Link("h").set_start_at(now).IsValid());
  EXPECT_FALSE(Link("h").set_start_at(now + 1).IsValid());
  EXPECT_THAT(log.lines(),
              ElementsAre(FailedCondition("entry", "0 < start_at_ && start_at_ > timeNow")));
}

TEST_F(StoppedClock, SessionsAndGrantsLapseWithTheSecondOfTheirTimeOut) {
  const LogCapture quiet;
  EXPECT_FALSE(velk_test::SampleSession("s").set_timeout(now).IsLegal());
  EXPECT_TRUE(velk_test::SampleSession("s").set_timeout(now + 1).IsLegal());
  EXPECT_FALSE(velk_test::SampleToken(1, 1).set_timeout(now).IsLegal());
  EXPECT_TRUE(velk_test::SampleToken(1, 1).set_timeout(now + 1).IsLegal());
}

TEST_F(StoppedClock, TimesAreReadWithTheDaylightSavingOfNow) {
  setenv("TZ", "CET-1CEST,M3.5.0,M10.5.0/3", 1);
  tzset();
  const char *const format = "%Y-%m-%d %H:%M:%S";
  Entry entry;
  SetClock(1704067200);  // in winter
  entry.set_start_at_str("2024-07-01 12:00:00", format);
  EXPECT_EQ(1719831600, entry.get_start_at());  // 11:00 UTC
  SetClock(1719792000);                         // in summer
  entry.set_start_at_str("2024-07-01 12:00:00", format);
  EXPECT_EQ(1719828000, entry.get_start_at());  // 10:00 UTC
  unsetenv("TZ");
  tzset();
}

class StoppedClockPurge : public StoppedClock {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    db_ = std::make_unique<BaseDB>(path_, 0600);
    ASSERT_TRUE(db_->IsGood());
  }

  std::string Value(const std::string &sql) { return RawDatabase(path_).Value(sql); }

  velk_test::TempDir folder_;
  std::string path_ = folder_.File("clock.db");
  std::unique_ptr<BaseDB> db_;
};

TEST_F(StoppedClockPurge, LeavesLinksOfThisSecond) {
  VELK::sharing::db::EntryDB store(*db_);
  for (const long expiry : {now - 1, now, now + 1}) {
    Entry entry = Link(std::to_string(expiry)).set_expire_at(expiry);
    ASSERT_TRUE(store.Create(entry));
  }
  EXPECT_TRUE(store.PurgeExpired(1.0f));
  EXPECT_EQ(
      "DELETE FROM entry WHERE auto_gc = 1 AND  ((expire_at != 0 AND expire_at < 1700000000) OR "
      "(expire_times != 0 AND use_count >= expire_times))",
      db_->GetLastQuery());
  EXPECT_EQ("1700000000,1700000001", Value("SELECT group_concat(hash) FROM entry"));
  EXPECT_TRUE(store.PurgeExpiredByOwnerProject(UID_ERR, ""));
  EXPECT_EQ(
      "DELETE FROM entry WHERE ((expire_at != 0 AND expire_at < 1700000000) OR "
      "(expire_times != 0 AND use_count >= expire_times))",
      db_->GetLastQuery());
  EXPECT_EQ("1700000000,1700000001", Value("SELECT group_concat(hash) FROM entry"));
}

TEST_F(StoppedClockPurge, LeavesSessionsOfThisSecond) {
  for (const char *timeout : {"1699999999", "1700000000", "1700000001"})
    ASSERT_TRUE(db_->Insert("session", {timeout, "1", "ip", timeout}));
  EXPECT_TRUE(VELK::sharing::db::SessionDB(*db_).PurgeExpired(1.0f));
  EXPECT_EQ("DELETE FROM session WHERE timeout < '1700000000'", db_->GetLastQuery());
  EXPECT_EQ("1700000000,1700000001", Value("SELECT group_concat(session_id) FROM session"));
}

TEST_F(StoppedClockPurge, LeavesGrantsOfThisSecond) {
  for (const char *timeout : {"1699999999", "1700000000", "1700000001"})
    ASSERT_TRUE(db_->Insert("token", {"1", "1", timeout}));
  EXPECT_TRUE(VELK::sharing::db::TokenDB(*db_).PurgeExpired(1.0f));
  EXPECT_EQ("DELETE FROM token WHERE timeout < '1700000000'", db_->GetLastQuery());
  EXPECT_EQ("1700000000,1700000001", Value("SELECT group_concat(timeout) FROM token"));
}

}  // namespace
