#include <gtest/gtest.h>
#include <velksharing/store.h>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::AnyOf;
using ::testing::ElementsAre;
using VELK::sharing::db::BaseDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using VELK::sharing::record::Token;
using velk_test::FailedConditionAt;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::SampleToken;

class TokenDb : public ::testing::Test {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    db_ = std::make_unique<BaseDB>(path_, 0600);
    ASSERT_TRUE(db_->IsGood());
    store_ = std::make_unique<VELK::sharing::db::TokenDB>(*db_);
  }

  Token Stored(int session_id, int entry_id) {
    Token token = SampleToken(session_id, entry_id);
    EXPECT_TRUE(store_->Create(token)) << db_->GetLastError();
    return token;
  }

  void SetTimeout(const Token &token, long timeout) {
    ASSERT_TRUE(db_->Execute("UPDATE token SET timeout = " + std::to_string(timeout) +
                             " WHERE id = " + std::to_string(token.get_id())));
  }

  /// The grants as "session on entry".
  std::vector<std::string> Grants() {
    std::vector<std::string> grants;
    for (const auto &row :
         RawDatabase(path_).Rows("SELECT session_id || ' on ' || entry_id FROM token ORDER BY id"))
      grants.push_back(row[0]);
    return grants;
  }

  velk_test::TempDir folder_;
  std::string path_ = folder_.File("token.db");
  std::unique_ptr<BaseDB> db_;
  std::unique_ptr<VELK::sharing::db::TokenDB> store_;
};

TEST_F(TokenDb, CreateStoresEveryColumnInTheTablesOrder) {
  const Token token = Stored(12, 7);
  EXPECT_EQ(1, token.get_id());
  EXPECT_EQ(token.GetFieldList(),
            RawDatabase(path_).Rows("SELECT entry_id, session_id, timeout FROM token").at(0));
  Token loaded;
  EXPECT_TRUE(store_->GetById(1, loaded));
  EXPECT_EQ("SELECT * FROM token WHERE id = 1", db_->GetLastQuery());
  EXPECT_EQ(token.GetFieldMap(), loaded.GetFieldMap());
}

TEST_F(TokenDb, UpdateWritesTheRow) {
  Token token = Stored(12, 7);
  EXPECT_TRUE(store_->Update(token.set_timeout(5000000000L)));
  EXPECT_EQ("UPDATE token SET entry_id='7',session_id='12',timeout='5000000000' WHERE id=1",
            db_->GetLastQuery());
  EXPECT_EQ("5000000000", RawDatabase(path_).Value("SELECT timeout FROM token"));
}

TEST_F(TokenDb, DeleteRemovesOneGrant) {
  Stored(1, 1);
  const Token second = Stored(2, 2);
  Stored(3, 3);
  EXPECT_TRUE(store_->Delete(1));
  EXPECT_TRUE(store_->Delete(second));
  EXPECT_EQ("DELETE FROM token WHERE id=2", db_->GetLastQuery());
  EXPECT_THAT(Grants(), ElementsAre("3 on 3"));
}

TEST_F(TokenDb, CountsAndQueriesByCondition) {
  Stored(1, 1);
  Stored(1, 2);
  int count = -1;
  store_->GetCondition().Where("entry_id", "2");
  EXPECT_TRUE(store_->Count(count));
  EXPECT_EQ("SELECT COUNT(*) AS c FROM token WHERE `entry_id` = '2'", db_->GetLastQuery());
  EXPECT_EQ(1, count);
  std::vector<Token> tokens;
  EXPECT_TRUE(store_->Query(tokens));
  EXPECT_EQ("SELECT * FROM token", db_->GetLastQuery());
  EXPECT_EQ(2u, tokens.size());
}

TEST_F(TokenDb, GetBySessionEntryFindsTheGrantOfThePair) {
  Stored(12, 8);
  Stored(13, 7);
  Stored(12, 7);
  Token token;
  EXPECT_TRUE(store_->GetBySessionEntry(Session().set_id(12), Entry().set_id(7), token));
  EXPECT_EQ("SELECT * FROM token WHERE session_id = 12 AND entry_id = 7", db_->GetLastQuery());
  EXPECT_EQ(3, token.get_id());
}

TEST_F(TokenDb, GetBySessionEntryFindsNothingForRecordsThatAreNotStored) {
  Stored(12, 7);
  const LogCapture log;
  Token token = SampleToken(77, 77);
  EXPECT_FALSE(store_->GetBySessionEntry(Session(), Entry(), token));
  EXPECT_EQ("SELECT * FROM token WHERE session_id = 0 AND entry_id = 0", db_->GetLastQuery());
  EXPECT_EQ(77, token.get_session_id());
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(TokenDb, GetBySessionEntryRefusesALapsedGrantAndFillsItAllTheSame) {
  SetTimeout(Stored(12, 7), 1000);
  const LogCapture log;
  Token token;
  EXPECT_FALSE(store_->GetBySessionEntry(Session().set_id(12), Entry().set_id(7), token));
  EXPECT_EQ(1, token.get_id());
  EXPECT_EQ(12, token.get_session_id());
  EXPECT_EQ(1000, token.get_timeout());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("token", 83, "time(NULL) >= timeout_")));
}

TEST_F(TokenDb, PurgeByEntryRemovesEveryGrantOnOneLink) {
  Stored(1, 7);
  Stored(2, 8);
  Stored(3, 7);
  EXPECT_TRUE(store_->PurgeByEntry(Entry().set_id(7)));
  EXPECT_EQ("DELETE FROM token WHERE entry_id = 7", db_->GetLastQuery());
  EXPECT_THAT(Grants(), ElementsAre("2 on 8"));
}

TEST_F(TokenDb, PurgeByEntryOfALinkWithoutGrantsSucceeds) {
  Stored(1, 7);
  EXPECT_TRUE(store_->PurgeByEntry(Entry().set_id(9)));
  EXPECT_TRUE(store_->PurgeByEntry(Entry()));
  EXPECT_THAT(Grants(), ElementsAre("1 on 7"));
}

TEST_F(TokenDb, PurgeExpiredDoesNothingWhenTheDrawMisses) {
  SetTimeout(Stored(1, 7), 1000);
  EXPECT_TRUE(store_->PurgeExpired(0.0f));
  EXPECT_THAT(Grants(), ElementsAre("1 on 7"));
}

TEST_F(TokenDb, PurgeExpiredRemovesLapsedGrants) {
  Stored(1, 7);
  SetTimeout(Stored(2, 7), 9);
  SetTimeout(Stored(3, 7), time(nullptr) - 1);
  const std::string from = std::to_string(time(nullptr));
  EXPECT_TRUE(store_->PurgeExpired(1.0f));
  const std::string to = std::to_string(time(nullptr));
  EXPECT_THAT(db_->GetLastQuery(), AnyOf("DELETE FROM token WHERE timeout < '" + from + "'",
                                         "DELETE FROM token WHERE timeout < '" + to + "'"));
  EXPECT_THAT(Grants(), ElementsAre("1 on 7"));
}

TEST_F(TokenDb, ReportsFailedStatements) {
  ASSERT_TRUE(db_->Execute("DROP TABLE token"));
  Token token;
  const LogCapture log;
  EXPECT_FALSE(store_->GetBySessionEntry(Session(), Entry(), token));
  EXPECT_FALSE(store_->PurgeByEntry(Entry()));
  EXPECT_FALSE(store_->PurgeExpired(1.0f));
  EXPECT_TRUE(log.lines().empty());
}

}  // namespace
