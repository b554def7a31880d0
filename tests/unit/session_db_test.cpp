#include <gtest/gtest.h>
#include <velksharing/store.h>

#include <set>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::AnyOf;
using ::testing::Each;
using ::testing::ElementsAre;
using VELK::sharing::db::BaseDB;
using VELK::sharing::record::Session;
using velk_test::ErrorLine;
using velk_test::FailedConditionAt;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::SampleSession;

const std::string url_friendly = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-_";

class SessionDb : public ::testing::Test {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    db_ = std::make_unique<BaseDB>(path_, 0600);
    ASSERT_TRUE(db_->IsGood());
    store_ = std::make_unique<VELK::sharing::db::SessionDB>(*db_);
  }

  Session Stored(const std::string &session_id) {
    Session session = SampleSession(session_id);
    EXPECT_TRUE(store_->Create(session)) << db_->GetLastError();
    return session;
  }

  void StoreLapsed(const std::string &session_id, long timeout) {
    const Session session = Stored(session_id);
    ASSERT_TRUE(db_->Execute("UPDATE session SET timeout = " + std::to_string(timeout) +
                             " WHERE id = " + std::to_string(session.get_id())));
  }

  std::vector<std::string> Identifiers() {
    std::vector<std::string> identifiers;
    for (const auto &row : RawDatabase(path_).Rows("SELECT session_id FROM session ORDER BY id"))
      identifiers.push_back(row[0]);
    return identifiers;
  }

  velk_test::TempDir folder_;
  std::string path_ = folder_.File("session.db");
  std::unique_ptr<BaseDB> db_;
  std::unique_ptr<VELK::sharing::db::SessionDB> store_;
};

TEST_F(SessionDb, CreateStoresEveryColumnInTheTablesOrder) {
  const Session session = Stored("secret");
  EXPECT_EQ(1, session.get_id());
  EXPECT_EQ(session.GetFieldList(),
            RawDatabase(path_).Rows("SELECT session_id, uid, ip, timeout FROM session").at(0));
  Session loaded;
  EXPECT_TRUE(store_->GetById(1, loaded));
  EXPECT_EQ("SELECT * FROM session WHERE id = 1", db_->GetLastQuery());
  EXPECT_EQ(session.GetFieldMap(), loaded.GetFieldMap());
}

TEST_F(SessionDb, CreateRefusesAnIdentifierThatIsTaken) {
  Stored("same");
  Session second = SampleSession("same");
  const LogCapture quiet;
  EXPECT_FALSE(store_->Create(second));
  EXPECT_THAT(Identifiers(), ElementsAre("same"));
}

TEST_F(SessionDb, CreateRefusesALapsedSession) {
  Session session = SampleSession("s").set_timeout(1);
  const LogCapture quiet;
  EXPECT_FALSE(store_->Create(session));
  EXPECT_THAT(Identifiers(), ElementsAre());
}

TEST_F(SessionDb, CreateWithSessionIdDraws32CharactersForUrls) {
  std::set<std::string> identifiers;
  for (int round = 0; round < 20; ++round) {
    Session session = SampleSession("");
    ASSERT_TRUE(store_->CreateWithSessionId(session));
    EXPECT_EQ(32u, session.get_session_id().size());
    EXPECT_EQ(std::string::npos, session.get_session_id().find_first_not_of(url_friendly));
    EXPECT_EQ(round + 1, session.get_id());
    identifiers.insert(session.get_session_id());
  }
  EXPECT_EQ(20u, identifiers.size());
}

TEST_F(SessionDb, CreateWithSessionIdGivesUpAfter51Attempts) {
  ASSERT_TRUE(db_->Execute("DROP TABLE session"));
  Session session = SampleSession("");
  const LogCapture log;
  EXPECT_FALSE(store_->CreateWithSessionId(session));
  EXPECT_EQ(51u, log.lines().size());
  EXPECT_THAT(log.lines(),
              Each(ErrorLine("%s:%d (%u) insert failed\n", "object_db:# (@) insert failed\n")));
  EXPECT_EQ(32u, session.get_session_id().size());
  EXPECT_EQ(0, session.get_id());
}

TEST_F(SessionDb, UpdateWritesTheRow) {
  Session session = Stored("s");
  EXPECT_TRUE(store_->Update(session.set_ip("2001:db8::1").set_uid(7).set_timeout(5000000000L)));
  EXPECT_EQ(
      "UPDATE session SET ip='2001:db8::1',session_id='s',timeout='5000000000',uid='7' WHERE id=1",
      db_->GetLastQuery());
  EXPECT_EQ("2001:db8::1", RawDatabase(path_).Value("SELECT ip FROM session"));
}

TEST_F(SessionDb, DeleteRemovesTheSessionAndNothingElse) {
  const Session first = Stored("a");
  Stored("b");
  Stored("c");
  VELK::sharing::record::Token token = velk_test::SampleToken(first.get_id(), 1);
  ASSERT_TRUE(VELK::sharing::db::TokenDB(*db_).Create(token));
  EXPECT_TRUE(store_->Delete(first));
  EXPECT_EQ("DELETE FROM session WHERE id=1", db_->GetLastQuery());
  EXPECT_TRUE(store_->Delete(2));
  EXPECT_THAT(Identifiers(), ElementsAre("c"));
  EXPECT_EQ("1", RawDatabase(path_).Value("SELECT COUNT(*) FROM token"));
}

TEST_F(SessionDb, NeverUsesTheIdOfADeletedSessionAgain) {
  const Session newest = Stored("a");
  ASSERT_TRUE(store_->Delete(newest));
  EXPECT_EQ(newest.get_id() + 1, Stored("b").get_id());
}

TEST_F(SessionDb, CountsAndQueriesByCondition) {
  Stored("a");
  Stored("b");
  int count = -1;
  store_->GetCondition().Where("session_id", "b");
  EXPECT_TRUE(store_->Count(count));
  EXPECT_EQ("SELECT COUNT(*) AS c FROM session WHERE `session_id` = 'b'", db_->GetLastQuery());
  EXPECT_EQ(1, count);
  std::vector<Session> sessions;
  EXPECT_TRUE(store_->Query(sessions));
  EXPECT_EQ("SELECT * FROM session", db_->GetLastQuery());
  EXPECT_EQ(2u, sessions.size());
}

TEST_F(SessionDb, GetBySessionIdFindsALiveSession) {
  Stored("other");
  Stored("secret");
  Session session;
  EXPECT_TRUE(store_->GetBySessionId("secret", session));
  EXPECT_EQ("SELECT * FROM session WHERE session_id = 'secret'", db_->GetLastQuery());
  EXPECT_EQ(2, session.get_id());
}

TEST_F(SessionDb, GetBySessionIdRefusesALapsedSessionAndFillsItAllTheSame) {
  StoreLapsed("old", 1000);
  const LogCapture log;
  Session session;
  EXPECT_FALSE(store_->GetBySessionId("old", session));
  EXPECT_EQ(1, session.get_id());
  EXPECT_EQ("old", session.get_session_id());
  EXPECT_EQ(1000, session.get_timeout());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("session", 89, "time(NULL) >= timeout_")));
}

TEST_F(SessionDb, GetBySessionIdOfAnUnknownIdentifierLeavesTheSessionAlone) {
  const LogCapture log;
  for (const std::string unknown : {"unknown", "", "' OR '1'='1"}) {
    Session session = SampleSession("before");
    EXPECT_FALSE(store_->GetBySessionId(unknown, session));
    EXPECT_EQ("before", session.get_session_id());
  }
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(SessionDb, EscapesIdentifiers) {
  Stored("it's");
  Stored("it");
  Session session;
  EXPECT_TRUE(store_->GetBySessionId("it's", session));
  EXPECT_EQ("SELECT * FROM session WHERE session_id = 'it''s'", db_->GetLastQuery());
  EXPECT_TRUE(store_->DeleteBySessionId("it's"));
  EXPECT_EQ("DELETE FROM session WHERE session_id = 'it''s'", db_->GetLastQuery());
  EXPECT_THAT(Identifiers(), ElementsAre("it"));
}

TEST_F(SessionDb, DeleteBySessionIdOfAnUnknownIdentifierSucceeds) {
  Stored("a");
  EXPECT_TRUE(store_->DeleteBySessionId("unknown"));
  EXPECT_THAT(Identifiers(), ElementsAre("a"));
}

TEST_F(SessionDb, PurgeExpiredDoesNothingWhenTheDrawMisses) {
  StoreLapsed("old", 1000);
  const std::string before = db_->GetLastQuery();
  EXPECT_TRUE(store_->PurgeExpired(0.0f));
  EXPECT_EQ(before, db_->GetLastQuery());
  EXPECT_THAT(Identifiers(), ElementsAre("old"));
}

TEST_F(SessionDb, PurgeExpiredRemovesLapsedSessions) {
  Stored("live");
  StoreLapsed("old", 9);
  StoreLapsed("lapsed", time(nullptr) - 1);
  const std::string from = std::to_string(time(nullptr));
  EXPECT_TRUE(store_->PurgeExpired(1.0f));
  const std::string to = std::to_string(time(nullptr));
  EXPECT_THAT(db_->GetLastQuery(), AnyOf("DELETE FROM session WHERE timeout < '" + from + "'",
                                         "DELETE FROM session WHERE timeout < '" + to + "'"));
  EXPECT_THAT(Identifiers(), ElementsAre("live"));
}

TEST_F(SessionDb, ReportsFailedStatements) {
  ASSERT_TRUE(db_->Execute("DROP TABLE session"));
  Session session;
  const LogCapture log;
  EXPECT_FALSE(store_->GetBySessionId("s", session));
  EXPECT_FALSE(store_->DeleteBySessionId("s"));
  EXPECT_FALSE(store_->PurgeExpired(1.0f));
  EXPECT_TRUE(log.lines().empty());
}

}  // namespace
