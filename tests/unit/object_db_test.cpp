#include <gtest/gtest.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/sample_records.h"
#include "support/temp_dir.h"

namespace {

using ::testing::ElementsAre;
using VELK::sharing::db::BaseDB;
using VELK::sharing::db::ObjectDB;
using VELK::sharing::db::Row;
using VELK::sharing::record::Object;
using VELK::sharing::record::Token;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::SampleToken;
using velk_test::TempDir;

/// The smallest record that a store takes.
class Note : public Object {
 public:
  explicit Note(std::string text = "", std::string author = "ann")
      : text_(std::move(text)), author_(std::move(author)) {}

  std::vector<std::string> GetFieldList() const override { return {text_, author_}; }
  std::map<std::string, std::string> GetFieldMap() const override {
    return {{"text", text_}, {"author", author_}, {"id", "999"}};
  }
  bool IsLegal() const override { return !text_.empty(); }
  void ToJSON(Json::Value &out) const override { out["text"] = text_; }
  bool FromRow(const Row &row) override {
    id_ = row.GetField("id").AsInt(0);
    text_ = row.GetField("text").AsString("");
    author_ = row.GetField("author").AsString("");
    return text_ != "unreadable";
  }
  int get_id() const override { return id_; }
  void set_id(int id) override { id_ = id; }

  const std::string &text() const { return text_; }

 private:
  int id_ = 0;
  std::string text_;
  std::string author_;
};

class NoteStore : public ObjectDB {
 public:
  explicit NoteStore(BaseDB &db) : ObjectDB(db, "note") {}
  using ObjectDB::Delete;
  bool Delete(int id) override {
    deleted_.push_back(id);
    return ObjectDB::Delete(id);
  }

  std::vector<int> deleted_;
};

/// The base store, bound to a table.
class PlainStore : public ObjectDB {
 public:
  PlainStore(BaseDB &db, const char *table) : ObjectDB(db, table) {}
  using ObjectDB::GetDB;
  using ObjectDB::GetTable;
};

class ObjectDb : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(
        db_.Execute("CREATE TABLE note (id INTEGER PRIMARY KEY, text TEXT UNIQUE, "
                    "author TEXT)"));
  }

  std::string Value(const std::string &sql) { return RawDatabase(path_).Value(sql); }

  Note Stored(const std::string &text) {
    Note note(text);
    EXPECT_TRUE(store_.Create(note));
    return note;
  }

  TempDir folder_;
  std::string path_ = folder_.File("object.db");
  BaseDB db_{path_, 0600};
  NoteStore store_{db_};
};

TEST_F(ObjectDb, KnowsItsConnectionAndItsTable) {
  const PlainStore store(db_, "note");
  EXPECT_EQ(&db_, &store.GetDB());
  EXPECT_EQ("note", store.GetTable());
}

TEST_F(ObjectDb, CreateInsertsTheFieldListAndSetsTheId) {
  ASSERT_TRUE(db_.Execute("INSERT INTO note VALUES (41,'x','y')"));
  Note note("it's");
  EXPECT_TRUE(store_.Create(note));
  EXPECT_EQ("INSERT INTO note VALUES (NULL,'it''s','ann')", db_.GetLastQuery());
  EXPECT_EQ(42, note.get_id());
  EXPECT_EQ("it's", Value("SELECT text FROM note WHERE id = 42"));
}

TEST_F(ObjectDb, CreateRefusesAnIllegalRecord) {
  const std::string before = db_.GetLastQuery();
  Note note("");
  note.set_id(5);
  const LogCapture log;

  EXPECT_FALSE(store_.Create(note));

  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) obj invalid\n", "object_db:# (@) obj invalid\n")));
  EXPECT_EQ(before, db_.GetLastQuery()) << "a statement was run";
  EXPECT_EQ(5, note.get_id());
}

TEST_F(ObjectDb, CreateReportsAFailedInsert) {
  Stored("same");
  Note second("same");
  const LogCapture log;

  EXPECT_FALSE(store_.Create(second));

  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) insert failed\n",
                                                 "object_db:# (@) insert failed\n")));
  EXPECT_EQ(0, second.get_id());
  EXPECT_NE("", db_.GetLastError());
}

TEST_F(ObjectDb, UpdateWritesEveryColumnButTheIdInOrderOfName) {
  Note note = Stored("first");
  Note changed("second", "bob");
  changed.set_id(note.get_id());
  EXPECT_TRUE(store_.Update(changed));
  EXPECT_EQ("UPDATE note SET author='bob',text='second' WHERE id=1", db_.GetLastQuery());
  EXPECT_EQ("second", Value("SELECT text FROM note"));
}

TEST_F(ObjectDb, UpdateRefusesAnIllegalRecord) {
  const std::string before = db_.GetLastQuery();
  const LogCapture log;
  EXPECT_FALSE(store_.Update(Note("")));
  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) obj invalid\n", "object_db:# (@) obj invalid\n")));
  EXPECT_EQ(before, db_.GetLastQuery()) << "a statement was run";
}

TEST_F(ObjectDb, UpdateReportsAFailedStatement) {
  Stored("taken");
  Note note = Stored("free");
  Note changed("taken");
  changed.set_id(note.get_id());
  const LogCapture log;
  EXPECT_FALSE(store_.Update(changed));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) update failed\n",
                                                 "object_db:# (@) update failed\n")));
}

TEST_F(ObjectDb, UpdateOfARowThatIsGoneSucceeds) {
  Note note("text");
  note.set_id(77);
  EXPECT_TRUE(store_.Update(note));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM note"));
}

TEST_F(ObjectDb, DeleteRemovesTheRow) {
  Stored("a");
  Stored("b");
  EXPECT_TRUE(store_.Delete(1));
  EXPECT_EQ("DELETE FROM note WHERE id=1", db_.GetLastQuery());
  EXPECT_EQ("b", Value("SELECT text FROM note"));
  EXPECT_TRUE(store_.Delete(1));
}

TEST_F(ObjectDb, DeleteOfARecordRunsTheStoresOwnDelete) {
  Stored("a");
  const Note note = Stored("b");
  ObjectDB &base = store_;
  EXPECT_TRUE(base.Delete(static_cast<const Object &>(note)));
  EXPECT_EQ((std::vector<int>{2}), store_.deleted_);
  EXPECT_EQ("a", Value("SELECT text FROM note"));
}

TEST_F(ObjectDb, DeleteReportsAFailedStatement) {
  PlainStore store(db_, "nowhere");
  const LogCapture log;
  EXPECT_FALSE(store.Delete(1));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) delete failed\n",
                                                 "object_db:# (@) delete failed\n")));
}

TEST_F(ObjectDb, GetByIdLoadsTheRow) {
  Stored("a");
  Stored("b");
  Note note;
  EXPECT_TRUE(store_.GetById(2, note));
  EXPECT_EQ("SELECT * FROM note WHERE id = 2", db_.GetLastQuery());
  EXPECT_EQ(2, note.get_id());
  EXPECT_EQ("b", note.text());
}

TEST_F(ObjectDb, GetByIdFailsWithoutTheRow) {
  const LogCapture log;
  Note note("before");
  EXPECT_FALSE(store_.GetById(-7, note));
  EXPECT_EQ("SELECT * FROM note WHERE id = -7", db_.GetLastQuery());
  EXPECT_EQ("before", note.text());
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(ObjectDb, GetByIdFailsForARowThatCannotBeUsed) {
  Stored("unreadable");
  Note note;
  EXPECT_FALSE(store_.GetById(1, note));
}

TEST_F(ObjectDb, GetByIdFailsWithTheStatement) {
  const LogCapture log;
  Note note;
  EXPECT_FALSE(PlainStore(db_, "nowhere").GetById(1, note));
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(ObjectDb, GetByIdNeitherUsesNorClearsTheCondition) {
  Stored("a");
  store_.GetCondition().Where("text", "other");
  Note note;
  EXPECT_TRUE(store_.GetById(1, note));
  EXPECT_EQ("SELECT * FROM note WHERE id = 1", db_.GetLastQuery());
  EXPECT_EQ(" WHERE `text` = 'other'", store_.GetCondition().GetSQL());
}

TEST_F(ObjectDb, CountsTheWholeTableWithoutACondition) {
  Stored("a");
  Stored("b");
  int count = -1;
  EXPECT_TRUE(store_.Count(count));
  EXPECT_EQ("SELECT COUNT(*) AS c FROM note", db_.GetLastQuery());
  EXPECT_EQ(2, count);
}

TEST_F(ObjectDb, CountUsesUpTheCondition) {
  Stored("a");
  Stored("b");
  store_.GetCondition().Where("text", "a");
  int count = -1;
  EXPECT_TRUE(store_.Count(count));
  EXPECT_EQ("SELECT COUNT(*) AS c FROM note WHERE `text` = 'a'", db_.GetLastQuery());
  EXPECT_EQ(1, count);
  EXPECT_TRUE(store_.GetCondition().IsEmpty());
}

TEST_F(ObjectDb, CountKeepsTheNumberWhenItFails) {
  store_.GetCondition().Where("nowhere = 1");
  int count = 77;
  EXPECT_FALSE(store_.Count(count));
  EXPECT_EQ(77, count);
  EXPECT_TRUE(store_.GetCondition().IsEmpty());
}

TEST_F(ObjectDb, CountFailsWithoutARow) {
  store_.GetCondition().Limit(1, 1);
  int count = 77;
  EXPECT_FALSE(store_.Count(count));
  EXPECT_EQ(77, count);
}

TEST_F(ObjectDb, FailsEveryStatementWithoutATable) {
  PlainStore store(db_, nullptr);
  Note note;
  int count = 77;
  EXPECT_FALSE(store.GetById(1, note));
  EXPECT_FALSE(store.Count(count));
  EXPECT_FALSE(store.Delete(1));
  EXPECT_EQ(77, count);
}

class ObjectDbQuery : public ::testing::Test {
 protected:
  void SetUp() override {
    velk_test::MakeSharingDatabase(path_);
    ASSERT_TRUE(db_->IsGood());
    for (int session = 1; session <= 3; ++session) {
      Token token = SampleToken(session, 10 * session);
      ASSERT_TRUE(store_->Create(token.GetObject()));
    }
  }

  std::vector<int> Sessions() const {
    std::vector<int> sessions;
    for (const Token &token : tokens_) sessions.push_back(token.get_session_id());
    return sessions;
  }

  TempDir folder_;
  std::string path_ = folder_.File("query.db");
  std::unique_ptr<BaseDB> db_ = Open();
  std::unique_ptr<PlainStore> store_ = std::make_unique<PlainStore>(*db_, "token");
  std::vector<Token> tokens_{SampleToken(77, 77)};

 private:
  std::unique_ptr<BaseDB> Open() const { return std::make_unique<BaseDB>(path_, 0600); }
};

TEST_F(ObjectDbQuery, LoadsTheWholeTableWithoutACondition) {
  EXPECT_TRUE(store_->Query(tokens_));
  EXPECT_EQ("SELECT * FROM token", db_->GetLastQuery());
  EXPECT_THAT(Sessions(), ElementsAre(1, 2, 3));
}

TEST_F(ObjectDbQuery, UsesUpTheCondition) {
  store_->GetCondition().Where("session_id > 1").OrderBy("id", true).Page(1, 5);
  EXPECT_TRUE(store_->Query(tokens_));
  EXPECT_EQ("SELECT * FROM token WHERE session_id > 1 ORDER BY id DESC LIMIT 5",
            db_->GetLastQuery());
  EXPECT_THAT(Sessions(), ElementsAre(3, 2));
  EXPECT_TRUE(store_->GetCondition().IsEmpty());
}

TEST_F(ObjectDbQuery, EmptiesTheListWhenNoRowFits) {
  store_->GetCondition().Where("session_id", "99");
  EXPECT_TRUE(store_->Query(tokens_));
  EXPECT_TRUE(tokens_.empty());
}

TEST_F(ObjectDbQuery, LeavesTheListAloneWhenTheStatementFails) {
  const LogCapture log;
  store_->GetCondition().Where("missing_column", "1");
  EXPECT_FALSE(store_->Query(tokens_));
  EXPECT_THAT(Sessions(), ElementsAre(77));
  EXPECT_TRUE(store_->GetCondition().IsEmpty());
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(ObjectDbQuery, LeavesTheListAloneForAnOffsetWithoutALimit) {
  store_->GetCondition().Limit(5, 0);
  EXPECT_FALSE(store_->Query(tokens_));
  EXPECT_THAT(Sessions(), ElementsAre(77));
}

TEST_F(ObjectDbQuery, SkipsRowsThatCannotBeUsed) {
  ASSERT_TRUE(db_->Execute("UPDATE token SET timeout = 1 WHERE session_id = 2"));
  const LogCapture log;
  EXPECT_TRUE(store_->Query(tokens_));
  EXPECT_THAT(Sessions(), ElementsAre(1, 3));
}

TEST_F(ObjectDbQuery, ClearsAConditionThatIsOnlyAnUnsetPage) {
  store_->GetCondition().Limit(0, 0);
  EXPECT_TRUE(store_->Query(tokens_));
  EXPECT_EQ("SELECT * FROM token", db_->GetLastQuery());
  EXPECT_TRUE(store_->GetCondition().IsEmpty());
}

}  // namespace
