#include <gtest/gtest.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <set>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::UnorderedElementsAre;
using VELK::sharing::UID_ERR;
using VELK::sharing::db::BaseDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Token;
using velk_test::ErrorLine;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::SampleEntry;

const std::string alphanumeric = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";

class EntryDb : public ::testing::Test {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    db_ = std::make_unique<BaseDB>(path_, 0600);
    ASSERT_TRUE(db_->IsGood());
    store_ = std::make_unique<VELK::sharing::db::EntryDB>(*db_);
  }

  Entry Stored(Entry entry) {
    EXPECT_TRUE(store_->Create(entry)) << db_->GetLastError();
    return entry;
  }

  std::vector<std::string> Hashes() {
    std::vector<std::string> hashes;
    for (const auto &row : RawDatabase(path_).Rows("SELECT hash FROM entry ORDER BY id"))
      hashes.push_back(row[0]);
    return hashes;
  }

  velk_test::TempDir folder_;
  std::string path_ = folder_.File("entry.db");
  std::unique_ptr<BaseDB> db_;
  std::unique_ptr<VELK::sharing::db::EntryDB> store_;
};

/// Whether `query` is `head` + a moment between the two + `tail`.
void ExpectStatementAt(const std::string &query, const std::string &head, const std::string &tail,
                       long from, long to) {
  ASSERT_EQ(0u, query.find(head)) << query;
  const std::string rest = query.substr(head.size());
  size_t digits = 0;
  const long moment = std::stol(rest, &digits);
  EXPECT_GE(moment, from);
  EXPECT_LE(moment, to);
  EXPECT_EQ(tail, rest.substr(digits));
}

TEST_F(EntryDb, CreateStoresEveryColumn) {
  Entry entry = SampleEntry("aB3xK9pQ2");
  entry.set_expire_times(5).set_use_count(1);
  ASSERT_TRUE(store_->Create(entry));
  EXPECT_EQ(1, entry.get_id());
  Entry loaded;
  ASSERT_TRUE(store_->GetById(1, loaded));
  EXPECT_EQ("SELECT * FROM entry WHERE id = 1", db_->GetLastQuery());
  EXPECT_EQ(1, loaded.get_id());
  EXPECT_EQ(entry.GetFieldMap(), loaded.GetFieldMap());
}

TEST_F(EntryDb, CreateWritesTheColumnsInTheTablesOrder) {
  const Entry entry = Stored(SampleEntry("aB3xK9pQ2").set_owner_uid(1026).set_start_at(5));
  const auto row = RawDatabase(path_).Rows(
      "SELECT hash, project_name, enabled, owner_uid, start_at, expire_at, "
      "expire_times, use_count, auto_gc, data FROM entry");
  EXPECT_EQ(entry.GetFieldList(), row.at(0));
}

TEST_F(EntryDb, CreateRefusesAHashThatIsTaken) {
  Stored(SampleEntry("same"));
  Entry second = SampleEntry("same");
  const LogCapture log;
  EXPECT_FALSE(store_->Create(second));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) insert failed\n",
                                                 "object_db:# (@) insert failed\n")));
}

TEST_F(EntryDb, CreateWithHashDrawsNineLettersAndDigits) {
  std::set<std::string> hashes;
  for (int round = 0; round < 20; ++round) {
    Entry entry = SampleEntry("");
    ASSERT_TRUE(store_->CreateWithHash(entry));
    EXPECT_EQ(9u, entry.get_hash().size());
    EXPECT_EQ(std::string::npos, entry.get_hash().find_first_not_of(alphanumeric));
    EXPECT_EQ(round + 1, entry.get_id());
    hashes.insert(entry.get_hash());
  }
  EXPECT_EQ(20u, hashes.size());
}

TEST_F(EntryDb, CreateWithHashReplacesAnEarlierHash) {
  Entry entry = SampleEntry("chosen");
  ASSERT_TRUE(store_->CreateWithHash(entry));
  EXPECT_NE("chosen", entry.get_hash());
  EXPECT_THAT(Hashes(), ElementsAre(entry.get_hash()));
}

TEST_F(EntryDb, CreateWithHashGivesUpAfter51Attempts) {
  ASSERT_TRUE(db_->Execute("DROP TABLE entry"));
  Entry entry = SampleEntry("");
  const LogCapture log;
  EXPECT_FALSE(store_->CreateWithHash(entry));
  EXPECT_EQ(51u, log.lines().size());
  EXPECT_THAT(log.lines(),
              Each(ErrorLine("%s:%d (%u) insert failed\n", "object_db:# (@) insert failed\n")));
  EXPECT_EQ(25u, entry.get_hash().size());
  EXPECT_EQ(0, entry.get_id());
}

TEST_F(EntryDb, CreateWithHashRefusesAnIllegalLinkEveryTime) {
  Entry entry;
  const LogCapture log;
  EXPECT_FALSE(store_->CreateWithHash(entry));
  EXPECT_EQ(102u, log.lines().size());  // the reason and the refusal
  EXPECT_THAT(Hashes(), ElementsAre());
}

TEST_F(EntryDb, UpdateWritesTheRow) {
  Entry entry = Stored(SampleEntry("h"));
  Stored(SampleEntry("other"));
  EXPECT_TRUE(store_->Update(entry.set_project_name("it's").set_enabled(false)));
  EXPECT_EQ(0u, db_->GetLastQuery().find("UPDATE entry SET auto_gc='1',data='"));
  EXPECT_NE(std::string::npos, db_->GetLastQuery().find(",project_name='it''s',"));
  EXPECT_EQ("it's|0", RawDatabase(path_).Value(
                          "SELECT project_name || '|' || enabled FROM entry WHERE id = 1"));
  EXPECT_EQ("photo", RawDatabase(path_).Value("SELECT project_name FROM entry WHERE id = 2"));
}

TEST_F(EntryDb, UpdateRefusesAnIllegalLink) {
  Entry entry = Stored(SampleEntry("h"));
  const LogCapture quiet;
  EXPECT_FALSE(store_->Update(entry.set_hash("")));
  EXPECT_THAT(Hashes(), ElementsAre("h"));
}

TEST_F(EntryDb, DeleteRemovesTheLinkAndNothingElse) {
  const Entry first = Stored(SampleEntry("a"));
  Stored(SampleEntry("b"));
  Stored(SampleEntry("c"));
  Token token = velk_test::SampleToken(1, first.get_id());
  ASSERT_TRUE(VELK::sharing::db::TokenDB(*db_).Create(token));
  EXPECT_TRUE(store_->Delete(first));
  EXPECT_EQ("DELETE FROM entry WHERE id=1", db_->GetLastQuery());
  EXPECT_TRUE(store_->Delete(2));
  EXPECT_THAT(Hashes(), ElementsAre("c"));
  EXPECT_EQ("1", RawDatabase(path_).Value("SELECT COUNT(*) FROM token"));
}

TEST_F(EntryDb, NeverUsesTheIdOfADeletedLinkAgain) {
  Stored(SampleEntry("a"));
  const Entry newest = Stored(SampleEntry("b"));
  ASSERT_TRUE(store_->Delete(newest));
  EXPECT_EQ(newest.get_id() + 1, Stored(SampleEntry("c")).get_id());
}

TEST_F(EntryDb, GetByTokenFindsTheLinkOfAGrant) {
  Stored(SampleEntry("a"));
  Stored(SampleEntry("b"));
  Entry entry;
  EXPECT_TRUE(store_->GetByToken(velk_test::SampleToken(1, 2), entry));
  EXPECT_EQ("SELECT * FROM entry WHERE id = 2", db_->GetLastQuery());
  EXPECT_EQ("b", entry.get_hash());
  EXPECT_FALSE(store_->GetByToken(velk_test::SampleToken(1, 99), entry));
  EXPECT_FALSE(store_->GetByToken(Token(), entry));
}

TEST_F(EntryDb, GetByHashFindsTheLink) {
  Stored(SampleEntry("other"));
  Stored(SampleEntry("aB3xK9pQ2"));
  Entry entry;
  EXPECT_TRUE(store_->GetByHash("aB3xK9pQ2", entry));
  EXPECT_EQ("SELECT * FROM entry WHERE hash = 'aB3xK9pQ2'", db_->GetLastQuery());
  EXPECT_EQ(2, entry.get_id());
}

TEST_F(EntryDb, GetByHashTellsLargeAndSmallLettersApart) {
  Stored(SampleEntry("aB3xK9pQ2"));
  Entry entry;
  EXPECT_FALSE(store_->GetByHash("AB3XK9PQ2", entry));
}

TEST_F(EntryDb, GetByHashOfAnUnknownHashLeavesTheLinkAlone) {
  const LogCapture log;
  for (const std::string hash : {"unknown", "", "' OR '1'='1", "%"}) {
    Entry entry = SampleEntry("before");
    EXPECT_FALSE(store_->GetByHash(hash, entry));
    EXPECT_EQ("before", entry.get_hash());
  }
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(EntryDb, GetByHashEscapesTheHash) {
  Stored(SampleEntry("it's"));
  Entry entry;
  EXPECT_TRUE(store_->GetByHash("it's", entry));
  EXPECT_EQ("SELECT * FROM entry WHERE hash = 'it''s'", db_->GetLastQuery());
}

TEST_F(EntryDb, GetByHashTakesTenMegabytes) {
  Entry entry;
  EXPECT_FALSE(store_->GetByHash(std::string(10u << 20, '\''), entry));
}

TEST_F(EntryDb, GetByHashFailsForALinkThatCannotBeUsed) {
  Stored(SampleEntry("h"));
  ASSERT_TRUE(db_->Execute("UPDATE entry SET data = 'nonsense'"));
  Entry entry;
  EXPECT_FALSE(store_->GetByHash("h", entry));
  EXPECT_FALSE(store_->GetById(1, entry));
}

TEST_F(EntryDb, GetByHashFailsWithTheStatement) {
  ASSERT_TRUE(db_->Execute("DROP TABLE entry"));
  Entry entry;
  EXPECT_FALSE(store_->GetByHash("h", entry));
}

TEST_F(EntryDb, CountsAndQueriesByCondition) {
  Stored(SampleEntry("a"));
  Stored(SampleEntry("b").set_project_name("video"));
  Stored(SampleEntry("c"));
  int count = -1;
  store_->GetCondition().Where(VELK::sharing::SZK_PROJECT_NAME, "photo");
  EXPECT_TRUE(store_->Count(count));
  EXPECT_EQ("SELECT COUNT(*) AS c FROM entry WHERE `project_name` = 'photo'", db_->GetLastQuery());
  EXPECT_EQ(2, count);

  std::vector<Entry> entries;
  store_->GetCondition().Where(VELK::sharing::SZK_PROJECT_NAME, "photo").OrderBy("id", true);
  EXPECT_TRUE(store_->Query(entries));
  ASSERT_EQ(2u, entries.size());
  EXPECT_EQ("c", entries[0].get_hash());
  EXPECT_EQ("a", entries[1].get_hash());
  EXPECT_TRUE(store_->GetCondition().IsEmpty());
}

TEST_F(EntryDb, QuerySkipsLinksThatCannotBeUsed) {
  Stored(SampleEntry("a"));
  Stored(SampleEntry("b"));
  Stored(SampleEntry("c"));
  ASSERT_TRUE(db_->Execute("UPDATE entry SET data = '[]' WHERE hash = 'b'"));
  const LogCapture quiet;
  std::vector<Entry> entries;
  EXPECT_TRUE(store_->Query(entries));
  EXPECT_EQ(2u, entries.size());
}

TEST_F(EntryDb, KeepsTenMegabytesAndBrokenBytes) {
  Entry entry = SampleEntry("h");
  Json::Value app(Json::objectValue);
  app["large"] = std::string(10u << 20, 'x');
  app["\xff\xfe"] = "\x80'\xc0";
  Stored(entry.set_app(app));
  Entry loaded;
  ASSERT_TRUE(store_->GetByHash("h", loaded));
  EXPECT_TRUE(app == loaded.get_app());
}

TEST_F(EntryDb, DeleteByOwnerUidRemovesEveryLinkOfOneOwner) {
  Stored(SampleEntry("a").set_owner_uid(1026));
  Stored(SampleEntry("b").set_owner_uid(4294967294u));
  Stored(SampleEntry("c").set_owner_uid(1026));
  EXPECT_TRUE(store_->DeleteByOwnerUid(1026));
  EXPECT_EQ("DELETE FROM entry WHERE owner_uid = 1026", db_->GetLastQuery());
  EXPECT_THAT(Hashes(), ElementsAre("b"));
  EXPECT_TRUE(store_->DeleteByOwnerUid(4294967294u));
  EXPECT_EQ("DELETE FROM entry WHERE owner_uid = 4294967294", db_->GetLastQuery());
  EXPECT_THAT(Hashes(), ElementsAre());
}

TEST_F(EntryDb, PurgeExpiredDoesNothingWhenTheDrawMisses) {
  Stored(SampleEntry("old").set_expire_at(1));
  const std::string before = db_->GetLastQuery();
  EXPECT_TRUE(store_->PurgeExpired(0.0f));
  EXPECT_EQ(before, db_->GetLastQuery());
  EXPECT_THAT(Hashes(), ElementsAre("old"));
}

TEST_F(EntryDb, PurgeExpiredRemovesMarkedLinksThatAreOver) {
  Stored(SampleEntry("old").set_expire_at(time(nullptr) - 1));
  Stored(SampleEntry("used up").set_expire_times(3).set_use_count(3));
  Stored(SampleEntry("over used").set_expire_times(3).set_use_count(4));
  Stored(SampleEntry("kept old").set_expire_at(1).set_auto_gc(false));
  Stored(SampleEntry("kept used up").set_expire_times(3).set_use_count(3).set_auto_gc(false));
  Stored(SampleEntry("kept open").set_use_count(1000));
  Stored(SampleEntry("kept live").set_expire_at(time(nullptr) + 60));
  Stored(SampleEntry("kept unused").set_expire_times(3).set_use_count(2));

  const long from = time(nullptr);
  EXPECT_TRUE(store_->PurgeExpired(1.0f));

  ExpectStatementAt(db_->GetLastQuery(),
                    "DELETE FROM entry WHERE auto_gc = 1 AND  ((expire_at != 0 AND expire_at < ",
                    ") OR (expire_times != 0 AND use_count >= expire_times))", from, time(nullptr));
  EXPECT_THAT(Hashes(),
              ElementsAre("kept old", "kept used up", "kept open", "kept live", "kept unused"));
}

TEST_F(EntryDb, PurgeExpiredComparesTimesAsNumbers) {
  Stored(SampleEntry("short").set_expire_at(9));
  Stored(SampleEntry("long").set_expire_at(20000000000L));
  EXPECT_TRUE(store_->PurgeExpired(1.0f));
  EXPECT_THAT(Hashes(), ElementsAre("long"));
}

TEST_F(EntryDb, PurgeByNobodyAndNothingRemovesEveryExpiredLink) {
  Stored(SampleEntry("marked").set_expire_at(1));
  Stored(SampleEntry("unmarked").set_expire_at(1).set_auto_gc(false));
  Stored(SampleEntry("used up").set_expire_times(1).set_use_count(1).set_auto_gc(false));
  Stored(SampleEntry("live"));
  const long from = time(nullptr);
  EXPECT_TRUE(store_->PurgeExpiredByOwnerProject(UID_ERR, ""));
  ExpectStatementAt(db_->GetLastQuery(),
                    "DELETE FROM entry WHERE ((expire_at != 0 AND expire_at < ",
                    ") OR (expire_times != 0 AND use_count >= expire_times))", from, time(nullptr));
  EXPECT_THAT(Hashes(), ElementsAre("live"));
}

TEST_F(EntryDb, PurgeByOwnerAndProjectLeavesOthersAlone) {
  Stored(SampleEntry("mine").set_expire_at(1));
  Stored(SampleEntry("mine, video").set_expire_at(1).set_project_name("video"));
  Stored(SampleEntry("other's").set_expire_at(1).set_owner_uid(1));
  const long from = time(nullptr);
  EXPECT_TRUE(store_->PurgeExpiredByOwnerProject(1026, "photo"));
  ExpectStatementAt(db_->GetLastQuery(),
                    "DELETE FROM entry WHERE owner_uid = 1026 AND project_name = 'photo' AND "
                    "((expire_at != 0 AND expire_at < ",
                    ") OR (expire_times != 0 AND use_count >= expire_times))", from, time(nullptr));
  EXPECT_THAT(Hashes(), UnorderedElementsAre("mine, video", "other's"));
}

TEST_F(EntryDb, PurgeByProjectAlone) {
  Stored(SampleEntry("a").set_expire_at(1).set_project_name("it's"));
  Stored(SampleEntry("b").set_expire_at(1).set_project_name("it"));
  const long from = time(nullptr);
  EXPECT_TRUE(store_->PurgeExpiredByOwnerProject(UID_ERR, "it's"));
  ExpectStatementAt(db_->GetLastQuery(),
                    "DELETE FROM entry WHERE project_name = 'it''s' AND "
                    "((expire_at != 0 AND expire_at < ",
                    ") OR (expire_times != 0 AND use_count >= expire_times))", from, time(nullptr));
  EXPECT_THAT(Hashes(), ElementsAre("b"));
}

TEST_F(EntryDb, PurgeByOwnerAlone) {
  Stored(SampleEntry("a").set_expire_at(1).set_owner_uid(0));
  Stored(SampleEntry("b").set_expire_at(1).set_owner_uid(1));
  const long from = time(nullptr);
  EXPECT_TRUE(store_->PurgeExpiredByOwnerProject(0, ""));
  ExpectStatementAt(db_->GetLastQuery(),
                    "DELETE FROM entry WHERE owner_uid = 0 AND ((expire_at != 0 AND expire_at < ",
                    ") OR (expire_times != 0 AND use_count >= expire_times))", from, time(nullptr));
  EXPECT_THAT(Hashes(), ElementsAre("b"));
}

TEST_F(EntryDb, ReportsFailedStatements) {
  ASSERT_TRUE(db_->Execute("DROP TABLE entry"));
  const LogCapture log;
  EXPECT_FALSE(store_->DeleteByOwnerUid(1));
  EXPECT_FALSE(store_->PurgeExpired(1.0f));
  EXPECT_FALSE(store_->PurgeExpiredByOwnerProject(1, "p"));
  EXPECT_TRUE(log.lines().empty());
}

}  // namespace
