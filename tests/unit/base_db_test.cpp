#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>
#include <velksharing/database.h>

#include <filesystem>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "velk_paths.h"

namespace {

using ::testing::AnyOf;
using ::testing::ElementsAre;
using VELK::sharing::db::BaseDB;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::TempDir;

class BaseDb : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(db_.IsGood());
    ASSERT_TRUE(db_.Execute("CREATE TABLE item (id INTEGER PRIMARY KEY, a TEXT, b TEXT)"));
  }

  std::string Value(const std::string &sql) { return RawDatabase(path_).Value(sql); }

  TempDir folder_;
  std::string path_ = folder_.File("base.db");
  BaseDB db_{path_, 0660};
};

/// A connection whose file cannot be made.
class BrokenBaseDb : public ::testing::Test {
 protected:
  LogCapture log_;
  TempDir folder_;
  std::string path_ = folder_.File("missing/base.db");
  BaseDB db_{path_, 0660};
};

mode_t ModeOf(const std::string &path) {
  struct stat status = {};
  EXPECT_EQ(0, stat(path.c_str(), &status)) << path;
  return status.st_mode & 07777;
}

TEST_F(BaseDb, GivesANewFileExactlyTheGivenMode) {
  const mode_t before = umask(0077);
  const BaseDB fresh(folder_.File("fresh.db"), 0664);
  umask(before);

  EXPECT_TRUE(fresh.IsGood());
  EXPECT_EQ(0664u, ModeOf(folder_.File("fresh.db")));
}

TEST_F(BaseDb, GivesANewFileToTheSystemAccount) {
  struct stat status = {};
  ASSERT_EQ(0, stat(path_.c_str(), &status));
  EXPECT_EQ(static_cast<uid_t>(VELK_SYSTEM_UID), status.st_uid);
  EXPECT_EQ(static_cast<gid_t>(VELK_SYSTEM_GID), status.st_gid);
}

TEST_F(BaseDb, LeavesTheModeOfAnExistingFileAlone) {
  const std::string existing = folder_.File("existing.db");
  velk_test::WriteFile(existing, "");
  ASSERT_EQ(0, chmod(existing.c_str(), 0640));

  const BaseDB opened(existing, 0660);

  EXPECT_TRUE(opened.IsGood());
  EXPECT_EQ(0640u, ModeOf(existing));
}

TEST_F(BaseDb, KeepsTheRowsOfAnExistingFile) {
  ASSERT_TRUE(db_.Insert("item", {"x", "y"}));
  BaseDB again(path_, 0660);
  Result result;
  Row row;
  ASSERT_TRUE(again.Execute("SELECT a FROM item", result));
  ASSERT_TRUE(result.NextRow(row));
  EXPECT_EQ("x", row.GetField("a").AsString(""));
}

TEST_F(BaseDb, LogsNothingWhileAllGoesWell) {
  const LogCapture log;
  BaseDB fresh(folder_.File("fresh.db"), 0660);
  fresh.Execute("SELECT 1");
  fresh.Execute("no statement");
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(BaseDb, KeepsFiveThousandPagesInItsCache) {
  Result result;
  Row row;
  ASSERT_TRUE(db_.Execute("PRAGMA cache_size", result));
  ASSERT_TRUE(result.NextRow(row));
  EXPECT_EQ(5000, row.GetField("cache_size").AsInt(0));
}

TEST_F(BaseDb, EnforcesForeignKeys) {
  ASSERT_TRUE(db_.Execute("CREATE TABLE part (item INTEGER REFERENCES item (id))"));
  EXPECT_FALSE(db_.Execute("INSERT INTO part VALUES (99)"));
}

TEST_F(BaseDb, SetsItsPragmasLastWhenItIsMade) {
  const BaseDB fresh(folder_.File("fresh.db"), 0660);
  EXPECT_EQ("PRAGMA foreign_keys = ON", fresh.GetLastQuery());
  EXPECT_EQ("", fresh.GetLastError());
}

TEST_F(BaseDb, RefusesAFolderInPlaceOfTheFile) {
  const LogCapture log;
  const BaseDB broken(folder_.path(), 0660);
  EXPECT_FALSE(broken.IsGood());
  EXPECT_EQ(1u, log.lines().size());
}

TEST_F(BaseDb, RefusesAFileThatIsNoDatabaseAndLeavesItAlone) {
  const std::string letter = folder_.File("letter.txt");
  const std::string text(5000, 'x');
  velk_test::WriteFile(letter, text);
  const LogCapture log;

  const BaseDB broken(letter, 0660);

  EXPECT_FALSE(broken.IsGood());
  EXPECT_THAT(
      log.lines(),
      ElementsAre(AnyOf(
          ErrorLine("%s:%d (%u) init failed\n\n", "base_db:# (@) init failed\n\n"),
          ErrorLine("%s:%d (%u) db connect failed\n\n", "base_db:# (@) db connect failed\n\n"))));
  EXPECT_EQ(text, velk_test::ReadFile(letter));
}

TEST_F(BaseDb, RefusesAnEmptyPath) {
  const LogCapture log;
  EXPECT_FALSE(BaseDB("", 0660).IsGood());
  EXPECT_EQ(1u, log.lines().size());
}

TEST_F(BaseDb, RemembersTheLastStatement) {
  db_.Execute("SELECT 1");
  EXPECT_EQ("SELECT 1", db_.GetLastQuery());
  db_.Execute("nonsense");
  EXPECT_EQ("nonsense", db_.GetLastQuery());
}

TEST_F(BaseDb, TellsWhyAStatementFailed) {
  EXPECT_EQ("", db_.GetLastError());
  EXPECT_FALSE(db_.Execute("SELECT * FROM nowhere"));
  EXPECT_NE(std::string::npos, db_.GetLastError().find("nowhere")) << db_.GetLastError();
}

TEST_F(BaseDb, KeepsTheLastErrorThroughLaterSuccess) {
  EXPECT_FALSE(db_.Execute("SELECT * FROM nowhere"));
  const std::string error = db_.GetLastError();
  EXPECT_TRUE(db_.Execute("SELECT 1"));
  EXPECT_EQ(error, db_.GetLastError());
}

TEST_F(BaseDb, RunsEveryStatementOfAScript) {
  EXPECT_TRUE(
      db_.Execute("INSERT INTO item VALUES (1,'x','y'); INSERT INTO item VALUES (2,'','')"));
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM item"));
}

TEST_F(BaseDb, HandsTheRowsToAResultByPointerAndByReference) {
  Result by_pointer;
  Result by_reference;
  EXPECT_TRUE(db_.Execute("SELECT 1 AS n", &by_pointer));
  EXPECT_TRUE(db_.Execute("SELECT 1 AS n", by_reference));
  EXPECT_TRUE(by_pointer.IsGood());
  EXPECT_TRUE(by_reference.IsGood());
}

TEST_F(BaseDb, GivesNoResultForAFailedStatement) {
  Result result;
  EXPECT_FALSE(db_.Execute("SELECT * FROM nowhere", result));
  EXPECT_FALSE(result.IsGood());
}

TEST_F(BaseDb, CommitsATransaction) {
  EXPECT_TRUE(db_.Begin());
  EXPECT_EQ("BEGIN TRANSACTION", db_.GetLastQuery());
  EXPECT_TRUE(db_.Insert("item", {"x", "y"}));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM item"));
  EXPECT_TRUE(db_.Commit());
  EXPECT_EQ("COMMIT", db_.GetLastQuery());
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM item"));
}

TEST_F(BaseDb, RefusesASecondBegin) {
  EXPECT_TRUE(db_.Begin());
  EXPECT_FALSE(db_.Begin());
  EXPECT_TRUE(db_.Commit());
}

TEST_F(BaseDb, RollsBackWhenACommitFails) {
  ASSERT_TRUE(
      db_.Execute("CREATE TABLE part (item INTEGER REFERENCES item (id) "
                  "DEFERRABLE INITIALLY DEFERRED)"));
  ASSERT_TRUE(db_.Begin());
  ASSERT_TRUE(db_.Execute("INSERT INTO part VALUES (99)"));

  EXPECT_FALSE(db_.Commit());

  EXPECT_EQ("ROLLBACK", db_.GetLastQuery());
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM part"));
  EXPECT_TRUE(db_.Begin()) << "the failed transaction is still open";
}

TEST_F(BaseDb, FailsToCommitWithoutATransaction) {
  EXPECT_FALSE(db_.Commit());
  EXPECT_EQ("ROLLBACK", db_.GetLastQuery());
}

TEST_F(BaseDb, DropsAnAbandonedTransactionWithTheConnection) {
  {
    BaseDB other(path_, 0660);
    ASSERT_TRUE(other.Begin());
    ASSERT_TRUE(other.Insert("item", {"x", "y"}));
  }
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM item"));
  EXPECT_TRUE(db_.Insert("item", {"x", "y"}));
}

TEST_F(BaseDb, VacuumsOutsideATransactionOnly) {
  EXPECT_TRUE(db_.Vacuum());
  EXPECT_EQ("VACUUM", db_.GetLastQuery());
  ASSERT_TRUE(db_.Begin());
  EXPECT_FALSE(db_.Vacuum());
}

TEST_F(BaseDb, EscapeDoublesQuotesAndNothingElse) {
  EXPECT_EQ("O''Brien", db_.Escape("O'Brien"));
  EXPECT_EQ("''''", db_.Escape("''"));
  EXPECT_EQ("\"`\\%_;--\n\t", db_.Escape("\"`\\%_;--\n\t"));
  EXPECT_EQ("", db_.Escape(""));
}

TEST_F(BaseDb, EscapeLeavesBytesThatAreNoTextAlone) {
  std::string bytes;
  for (int byte = 1; byte < 256; ++byte) {
    if (byte != '\'') bytes.push_back(static_cast<char>(byte));
  }
  EXPECT_EQ(bytes, db_.Escape(bytes));
}

TEST_F(BaseDb, EscapeCutsAtAZeroByte) {
  EXPECT_EQ("ab", db_.Escape(std::string("ab\0cd", 5)));
  EXPECT_EQ("", db_.Escape(std::string("\0'", 2)));
}

TEST_F(BaseDb, EscapesTenMegabytes) {
  const size_t size = 10u << 20;
  EXPECT_EQ(std::string(size, 'x'), db_.Escape(std::string(size, 'x')));
  EXPECT_EQ(std::string(2 * size, '\''), db_.Escape(std::string(size, '\'')));
}

TEST_F(BaseDb, InsertWritesNullForTheIdAndQuotesEveryValue) {
  EXPECT_TRUE(db_.Insert("item", {"a", "b"}));
  EXPECT_EQ("INSERT INTO item VALUES (NULL,'a','b')", db_.GetLastQuery());
}

TEST_F(BaseDb, InsertEscapesItsValues) {
  EXPECT_TRUE(db_.Insert("item", {"O'Brien", "'); DROP TABLE item; --"}));
  EXPECT_EQ("INSERT INTO item VALUES (NULL,'O''Brien','''); DROP TABLE item; --')",
            db_.GetLastQuery());
  EXPECT_EQ("O'Brien", Value("SELECT a FROM item"));
}

TEST_F(BaseDb, InsertWithoutValuesFails) {
  EXPECT_FALSE(db_.Insert("item", {}));
  EXPECT_EQ("INSERT INTO item VALUES (NULL,)", db_.GetLastQuery());
}

TEST_F(BaseDb, InsertWithTheWrongNumberOfValuesFails) {
  EXPECT_FALSE(db_.Insert("item", {"a"}));
  EXPECT_FALSE(db_.Insert("item", {"a", "b", "c"}));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM item"));
}

TEST_F(BaseDb, InsertKeepsTenMegabytes) {
  const std::string large(10u << 20, '\'');
  EXPECT_TRUE(db_.Insert("item", {large, "b"}));
  EXPECT_EQ(large, Value("SELECT a FROM item"));
}

TEST_F(BaseDb, UpdateWritesColumnsInTheOrderOfTheirNames) {
  ASSERT_TRUE(db_.Insert("item", {"1", "2"}));
  EXPECT_TRUE(db_.Update("item", {{"b", "x"}, {"a", "1"}}, 1));
  EXPECT_EQ("UPDATE item SET a='1',b='x' WHERE id=1", db_.GetLastQuery());
  EXPECT_EQ("x", Value("SELECT b FROM item"));
}

TEST_F(BaseDb, UpdateLeavesTheIdColumnOut) {
  EXPECT_TRUE(db_.Update("item", {{"a", "1"}, {"id", "9"}, {"b", "x"}}, 7));
  EXPECT_EQ("UPDATE item SET a='1',b='x' WHERE id=7", db_.GetLastQuery());
}

TEST_F(BaseDb, UpdateEscapesNamesAndValues) {
  EXPECT_FALSE(db_.Update("item", {{"a'b", "O'Brien"}}, 7));
  EXPECT_EQ("UPDATE item SET a''b='O''Brien' WHERE id=7", db_.GetLastQuery());
}

TEST_F(BaseDb, UpdateOfNothingButTheIdFails) {
  EXPECT_FALSE(db_.Update("item", {{"id", "9"}}, 7));
  EXPECT_EQ("UPDATE item SET  WHERE id=7", db_.GetLastQuery());
  EXPECT_FALSE(db_.Update("item", {}, -7));
  EXPECT_EQ("UPDATE item SET  WHERE id=-7", db_.GetLastQuery());
}

TEST_F(BaseDb, DeleteRemovesOneRow) {
  ASSERT_TRUE(db_.Insert("item", {"1", "2"}));
  ASSERT_TRUE(db_.Insert("item", {"3", "4"}));
  EXPECT_TRUE(db_.Delete("item", 1));
  EXPECT_EQ("DELETE FROM item WHERE id=1", db_.GetLastQuery());
  EXPECT_EQ("3", Value("SELECT a FROM item"));
}

TEST_F(BaseDb, DeleteOfAMissingRowSucceeds) {
  EXPECT_TRUE(db_.Delete("item", 12345));
  EXPECT_FALSE(db_.Delete("nowhere", 1));
}

TEST_F(BaseDb, TellsTheIdOfTheLastInsertedRow) {
  int id = -1;
  ASSERT_TRUE(db_.Execute("INSERT INTO item VALUES (41,'','')"));
  ASSERT_TRUE(db_.Insert("item", {"1", "2"}));
  EXPECT_TRUE(db_.GetLastInsertId(id));
  EXPECT_EQ(42, id);
}

TEST_F(BaseDb, KeepsTheLowBitsOfAnIdThatIsTooLarge) {
  int id = -1;
  ASSERT_TRUE(db_.Execute("INSERT INTO item VALUES (4294967303,'','')"));
  EXPECT_TRUE(db_.GetLastInsertId(id));
  EXPECT_EQ(7, id);
}

TEST_F(BrokenBaseDb, LogsThatTheFileCannotBeMade) {
  EXPECT_FALSE(db_.IsGood());
  EXPECT_THAT(log_.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) create database failed on %s\n\n",
                                    "base_db:# (@) create database failed on " + path_ + "\n\n")));
}

TEST_F(BrokenBaseDb, LogsEveryRefusedStatement) {
  log_.Clear();
  EXPECT_FALSE(db_.Execute("SELECT 1"));
  EXPECT_THAT(log_.lines(), ElementsAre(ErrorLine("%s:%d (%u) db is not good.\n\n",
                                                  "base_db:# (@) db is not good.\n\n")));
}

TEST_F(BrokenBaseDb, FailsEveryOperation) {
  EXPECT_FALSE(db_.Begin());
  EXPECT_FALSE(db_.Commit());
  EXPECT_FALSE(db_.Vacuum());
  EXPECT_FALSE(db_.Insert("item", {"a"}));
  EXPECT_FALSE(db_.Update("item", {{"a", "b"}}, 1));
  EXPECT_FALSE(db_.Delete("item", 1));
}

TEST_F(BrokenBaseDb, KeepsNoStatementAndNoError) {
  db_.Execute("SELECT 1");
  EXPECT_EQ("", db_.GetLastQuery());
  EXPECT_EQ("", db_.GetLastError());
}

TEST_F(BrokenBaseDb, GivesNoResult) {
  Result result;
  Row row;
  EXPECT_FALSE(db_.Execute("SELECT 1", result));
  EXPECT_FALSE(result.IsGood());
  EXPECT_FALSE(result.NextRow(row));
}

TEST_F(BrokenBaseDb, LeavesTheIdAlone) {
  int id = 77;
  EXPECT_FALSE(db_.GetLastInsertId(id));
  EXPECT_EQ(77, id);
}

TEST_F(BrokenBaseDb, StillEscapes) {
  EXPECT_EQ("O''Brien", db_.Escape("O'Brien"));
}

TEST_F(BrokenBaseDb, StaysBrokenWhenTheFolderAppears) {
  std::filesystem::create_directory(folder_.File("missing"));
  log_.Clear();
  EXPECT_FALSE(db_.IsGood());
  EXPECT_FALSE(db_.Execute("SELECT 1"));
}

}  // namespace
