#include <gtest/gtest.h>
#include <velksharing/store.h>
#include <velksharing/utils.h>

#include <system_error>

#include "fault/platform_override.h"
#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::IsProbabilityHit;
using VELK::sharing::db::BaseDB;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SessionDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
using velk_test::SampleEntry;
using velk_test::SampleSession;
namespace real = velk_test::real;

class RandomKeyFault : public ::testing::Test {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    db_ = std::make_unique<BaseDB>(path_, 0600);
    ASSERT_TRUE(db_->IsGood());
    Overrides().random_text = [this](const std::string &pool, unsigned int length,
                                     std::string &out) {
      pools_.push_back(pool);
      lengths_.push_back(length);
      return real::RandomText(pool, length, out);
    };
  }

  /// Lets the first `failures` INSERT statements fail, and notes the keys they would have written.
  void FailInserts(size_t failures) {
    Overrides().db_execute = [this, failures](VELKDBHandle *handle, const char *sql,
                                              DBResult **result) {
      const std::string statement = sql;
      if (statement.rfind("INSERT INTO ", 0) != 0) return real::DbExecute(handle, sql, result);
      const size_t start = statement.find('\'') + 1;
      keys_.push_back(statement.substr(start, statement.find('\'', start) - start));
      if (keys_.size() > failures) return real::DbExecute(handle, sql, result);
      if (result != nullptr) *result = nullptr;
      return -1;
    };
  }

  const OverrideScope scope_;
  const LogCapture quiet_;
  velk_test::TempDir folder_;
  std::string path_ = folder_.File("random.db");
  std::unique_ptr<BaseDB> db_;
  std::vector<std::string> pools_;
  std::vector<unsigned int> lengths_;
  std::vector<std::string> keys_;
};

TEST_F(RandomKeyFault, AHashGrowsByOneAfterEveryThirdOf51Attempts) {
  FailInserts(1000);
  Entry entry = SampleEntry("");
  EXPECT_FALSE(EntryDB(*db_).CreateWithHash(entry));

  std::vector<unsigned int> expected;
  for (unsigned int attempt = 0; attempt < 51; ++attempt) expected.push_back(9 + attempt / 3);
  EXPECT_EQ(9u, expected.front());
  EXPECT_EQ(25u, expected.back());
  EXPECT_EQ(expected, lengths_);
  ASSERT_EQ(51u, keys_.size());
  for (size_t attempt = 0; attempt < keys_.size(); ++attempt)
    EXPECT_EQ(expected[attempt], keys_[attempt].size());
  EXPECT_THAT(pools_, Each(std::string(VELK::RANDOM::POOL_ALPHA_NUMERIC)));
  EXPECT_EQ(keys_.back(), entry.get_hash());
}

TEST_F(RandomKeyFault, AHashIsDrawnAfreshUntilAnInsertWorks) {
  FailInserts(3);
  Entry entry = SampleEntry("");
  EXPECT_TRUE(EntryDB(*db_).CreateWithHash(entry));
  EXPECT_THAT(lengths_, ElementsAre(9u, 9u, 9u, 10u));
  EXPECT_EQ(10u, entry.get_hash().size());
  EXPECT_EQ(1, entry.get_id());
}

TEST_F(RandomKeyFault, TheLast51stHashMayStillWork) {
  FailInserts(50);
  Entry entry = SampleEntry("");
  EXPECT_TRUE(EntryDB(*db_).CreateWithHash(entry));
  EXPECT_EQ(25u, entry.get_hash().size());
}

TEST_F(RandomKeyFault, AHashThatIsTakenIsDrawnAgain) {
  Entry first = SampleEntry("taken");
  ASSERT_TRUE(EntryDB(*db_).Create(first));
  Overrides().random_text = [this](const std::string &, unsigned int length, std::string &out) {
    lengths_.push_back(length);
    out = lengths_.size() < 3 ? "taken" : "free";
    return true;
  };
  Entry second = SampleEntry("");
  EXPECT_TRUE(EntryDB(*db_).CreateWithHash(second));
  EXPECT_EQ("free", second.get_hash());
  EXPECT_EQ(3u, lengths_.size());
}

TEST_F(RandomKeyFault, NoLinkIsStoredWithoutRandomness) {
  Overrides().random_text = [](const std::string &, unsigned int, std::string &out) {
    out.clear();
    return false;
  };
  Entry entry = SampleEntry("before");
  EXPECT_FALSE(EntryDB(*db_).CreateWithHash(entry));
  EXPECT_EQ("0", velk_test::RawDatabase(path_).Value("SELECT COUNT(*) FROM entry"));
}

TEST_F(RandomKeyFault, ASessionIdKeepsItsLengthThrough51Attempts) {
  FailInserts(1000);
  Session session = SampleSession("");
  EXPECT_FALSE(SessionDB(*db_).CreateWithSessionId(session));
  EXPECT_EQ(std::vector<unsigned int>(51, 32u), lengths_);
  ASSERT_EQ(51u, keys_.size());
  for (const std::string &key : keys_) EXPECT_EQ(32u, key.size());
  EXPECT_THAT(pools_, Each(std::string(VELK::RANDOM::POOL_URL_FRIENDLY)));
  EXPECT_EQ(keys_.back(), session.get_session_id());
}

TEST_F(RandomKeyFault, ASessionIdIsDrawnAfreshUntilAnInsertWorks) {
  FailInserts(50);
  Session session = SampleSession("");
  EXPECT_TRUE(SessionDB(*db_).CreateWithSessionId(session));
  EXPECT_EQ(51u, keys_.size());
  EXPECT_EQ(1, session.get_id());
}

TEST_F(RandomKeyFault, NoSessionIsStoredWithoutRandomness) {
  Overrides().random_text = [](const std::string &, unsigned int, std::string &out) {
    out.clear();
    return false;
  };
  Session session = SampleSession("before");
  EXPECT_FALSE(SessionDB(*db_).CreateWithSessionId(session));
  EXPECT_EQ("0", velk_test::RawDatabase(path_).Value("SELECT COUNT(*) FROM session"));
}

TEST_F(RandomKeyFault, ASaltIsSixLettersAndDigits) {
  Entry entry = SampleEntry("h");
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_THAT(lengths_, ElementsAre(6u));
  EXPECT_THAT(pools_, ElementsAre(std::string(VELK::RANDOM::POOL_ALPHA_NUMERIC)));
}

TEST_F(RandomKeyFault, OnlyTheDefaultAlgorithmDrawsASalt) {
  Entry entry = SampleEntry("h");
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_MD5);
  entry.set_protect_password("digest", false, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_THAT(lengths_, IsEmpty());
}

TEST(SaltFault, WithoutASaltThereIsNoPasswordAndTheLinkIsIllegal) {
  const OverrideScope scope;
  Entry entry = SampleEntry("h");
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  entry.set_protect_password("secret", true, Entry::ENCRYPT_ALGO_DEFAULT);
  Overrides().random_text = [](const std::string &, unsigned int, std::string &out) {
    out.clear();
    return false;
  };
  const LogCapture log;
  entry.set_protect_password("other", true, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_THAT(log.Texts(), IsEmpty());
  EXPECT_EQ("", entry.get_protect_password());
  EXPECT_FALSE(entry.IsPasswordValid("secret"));
  EXPECT_FALSE(entry.IsPasswordValid("other"));
  EXPECT_FALSE(entry.IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition("entry", "!blValid_")));

  Overrides() = {};
  entry.set_protect_password("other", true, Entry::ENCRYPT_ALGO_DEFAULT);
  EXPECT_TRUE(entry.IsLegal());
  EXPECT_TRUE(entry.IsPasswordValid("other"));
}

/// Chance, with the number that is drawn fixed.
bool HitsWith(int drawn, float probability) {
  const OverrideScope scope;
  Overrides().random_number = [drawn](int low, int high) {
    EXPECT_EQ(0, low);
    EXPECT_EQ(99, high);
    return drawn;
  };
  return IsProbabilityHit(probability);
}

TEST(ChanceFault, HitsBelowTheThreshold) {
  EXPECT_TRUE(HitsWith(49, 0.5f));
  EXPECT_FALSE(HitsWith(50, 0.5f));
  EXPECT_TRUE(HitsWith(99, 1.0f));
}

TEST(ChanceFault, CutsTheThresholdDownToWholePercents) {
  EXPECT_TRUE(HitsWith(0, 0.015f));
  EXPECT_FALSE(HitsWith(1, 0.015f));
  EXPECT_FALSE(HitsWith(0, 0.0099f));
}

TEST(ChanceFault, MultipliesInSinglePrecision) {
  EXPECT_TRUE(HitsWith(28, 0.29f));  // 29 in single precision, 28.99… in double
  EXPECT_FALSE(HitsWith(29, 0.29f));
}

TEST(ChanceFault, DoesNotHitWithoutRandomness) {
  const OverrideScope scope;
  Overrides().random_number = [](int, int) -> int {
    throw std::system_error(std::make_error_code(std::errc::io_error));
  };
  EXPECT_FALSE(IsProbabilityHit(1.0f));
}

}  // namespace
