// Which statements a connection keeps compiled, and that nobody sees it by the results.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "plain_database.h"
#include "statement_generator.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velkdb_connection.h"

// The disk is not what is tested here.
extern "C" int fdatasync(int) {
  return 0;
}
extern "C" int fsync(int) {
  return 0;
}

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using velk_test::Outcome;
using velk_test::PlainDatabase;
using velk_test::RawDatabase;
using velk_test::StatementGenerator;
using velk_test::TempDir;
using velk_test::VelkDbConnection;

class VelkDbStatements : public testing::Test {
 protected:
  VelkDbStatements() {
    RawDatabase(path_).Run(
        "PRAGMA journal_mode = WAL; CREATE TABLE item (id INTEGER PRIMARY KEY, name TEXT, n);"
        "INSERT INTO item VALUES (5, 'five', 5), (6, 'it''s six', 6)");
    connection_ = std::make_unique<VelkDbConnection>(path_);
  }

  // The texts of the statements that the connection holds compiled, the newest first.
  std::vector<std::string> Kept() {
    std::vector<std::string> texts;
    sqlite3 *const sqlite = VELKDBSqlite(connection_->handle());
    for (sqlite3_stmt *kept = nullptr; (kept = sqlite3_next_stmt(sqlite, kept)) != nullptr;)
      texts.emplace_back(sqlite3_sql(kept));
    return texts;
  }

  // What is kept after running these.
  std::vector<std::string> KeptAfter(const std::vector<std::string> &statements) {
    for (const std::string &sql : statements) connection_->Run(sql);
    return Kept();
  }

  TempDir folder_;
  std::string path_ = folder_.File("test.db");
  std::unique_ptr<VelkDbConnection> connection_;
};

TEST_F(VelkDbStatements, ThoseThatDifferInTheirValuesAloneShareOne) {
  EXPECT_THAT(KeptAfter({"SELECT * FROM item WHERE name = 'five'",
                         "SELECT * FROM item WHERE name = 'it''s six'",
                         "SELECT * FROM item WHERE name = 7"}),
              ElementsAre("SELECT * FROM item WHERE name = ?"));
}

TEST_F(VelkDbStatements, ValuesOfAnInsertAreLifted) {
  EXPECT_THAT(KeptAfter({"INSERT INTO item VALUES (NULL,'one',1)",
                         "INSERT INTO item VALUES (NULL,'two',2)"}),
              ElementsAre("INSERT INTO item VALUES (NULL,?,?)"));
}

TEST_F(VelkDbStatements, ValuesOfAnUpdateAreLifted) {
  EXPECT_THAT(KeptAfter({"UPDATE item SET name='a',n='7' WHERE id=5"}),
              ElementsAre("UPDATE item SET name=?,n=? WHERE id=?"));
}

TEST_F(VelkDbStatements, ValuesThatNameColumnsAndPlacesStay) {
  EXPECT_THAT(KeptAfter({"SELECT 'a', n = 5 FROM item WHERE n = 5 ORDER BY 2"}),
              ElementsAre("SELECT 'a', n = 5 FROM item WHERE n = ? ORDER BY 2"));
}

TEST_F(VelkDbStatements, NumbersThatThePlannerLooksAtStay) {
  EXPECT_THAT(KeptAfter({"SELECT * FROM item WHERE n = 1 AND id != 0 LIMIT 5 OFFSET 6"}),
              ElementsAre("SELECT * FROM item WHERE n = 1 AND id != 0 LIMIT 5 OFFSET ?"));
}

TEST_F(VelkDbStatements, WhatIsNotSureIsNotKept) {
  EXPECT_THAT(
      KeptAfter({"PRAGMA user_version", "BEGIN", "COMMIT", "CREATE TABLE other (a)",
                 "SELECT n FROM item WHERE n = 5; SELECT n FROM item WHERE n = 6",
                 "SELECT n FROM item WHERE n = 5 -- five", "SELECT n FROM item WHERE n = 5.5",
                 "SELECT n FROM item WHERE n = x'00'", "SELECT n FROM item WHERE n = ?",
                 "SELECT n FROM item WHERE n IN (SELECT 5)",
                 "INSERT INTO item VALUES (NULL, abs(5), 5)",
                 "SELECT n FROM item WHERE n = 9223372036854775808"}),
      IsEmpty());
}

TEST_F(VelkDbStatements, ThePragmaThatTellsOfOthersChangesIsKeptAndTells) {
  const auto version = [&] { return connection_->Value("PRAGMA data_version", "data_version"); };
  const std::string before = version();
  EXPECT_THAT(Kept(), ElementsAre("PRAGMA data_version"));
  EXPECT_EQ(version(), before);
  ASSERT_EQ(VelkDbConnection(path_).Run("INSERT INTO item VALUES (7, 'seven', 7)"), 0);
  EXPECT_NE(version(), before);
}

TEST_F(VelkDbStatements, WrongOnesAreNotKept) {
  EXPECT_THAT(KeptAfter({"SELECT n FROM item WHERE nothing = 5", "SELECT FROM item WHERE n = 5"}),
              IsEmpty());
}

TEST_F(VelkDbStatements, ANumberRightBehindATextIsNoNumberOfAParameter) {
  EXPECT_EQ(connection_->Run("SELECT n FROM item WHERE name = 'five'37"), -1);
  EXPECT_EQ(connection_->Error(), "near \"37\": syntax error");
}

TEST_F(VelkDbStatements, LongOnesAreNotKept) {
  std::string sql = "SELECT n FROM item WHERE n = 2";
  while (sql.size() < 8192) sql += " OR n > 100";
  EXPECT_THAT(KeptAfter({sql}), IsEmpty());
}

TEST_F(VelkDbStatements, TheLastSixtyFourAreKept) {
  constexpr int kCapacity = 64;
  const auto sql = [](int number) {
    return "SELECT name AS name" + std::to_string(number) + " FROM item";
  };
  for (int i = 0; i < kCapacity; ++i) connection_->Run(sql(i));
  connection_->Run(sql(0));  // used again, so 1 is now the one used longest ago
  connection_->Run(sql(kCapacity));
  const std::vector<std::string> kept = Kept();
  const std::set<std::string> texts(kept.begin(), kept.end());
  EXPECT_EQ(texts.size(), kCapacity);
  EXPECT_EQ(texts.count(sql(0)), 1);
  EXPECT_EQ(texts.count(sql(1)), 0);
  EXPECT_EQ(texts.count(sql(kCapacity)), 1);
}

TEST_F(VelkDbStatements, AKeptOneHoldsNoLockAndNoValue) {
  connection_->Run("SELECT * FROM item WHERE name = 'five'");
  sqlite3_stmt *const kept = sqlite3_next_stmt(VELKDBSqlite(connection_->handle()), nullptr);
  EXPECT_EQ(sqlite3_stmt_busy(kept), 0);
  char *const expanded = sqlite3_expanded_sql(kept);
  EXPECT_STREQ(expanded, "SELECT * FROM item WHERE name = NULL");
  sqlite3_free(expanded);
}

TEST_F(VelkDbStatements, AKeptOneSeesATableMadeAnew) {
  EXPECT_EQ(connection_->Value("SELECT * FROM item WHERE n = 5", "name"), "five");
  RawDatabase(path_).Run(
      "DROP TABLE item; CREATE TABLE item (other, n TEXT); INSERT INTO item VALUES ('new', 5)");
  EXPECT_EQ(connection_->Value("SELECT * FROM item WHERE n = 5", "other"), "new");
  EXPECT_EQ(connection_->Value("SELECT * FROM item WHERE n = 5", "name"), "");
}

TEST_F(VelkDbStatements, AKeptOneWhoseTableIsGoneFailsWithTheUsualText) {
  connection_->Run("SELECT * FROM item WHERE n = 5");
  RawDatabase(path_).Run("DROP TABLE item");
  EXPECT_EQ(connection_->Run("SELECT * FROM item WHERE n = 5"), -1);
  EXPECT_EQ(connection_->Error(), "no such table: item");
}

// ---- Beside plain SQLite

Outcome RunThroughPlatform(VelkDbConnection &database, const char *sql, const Outcome &plain) {
  Outcome outcome;
  DBResult *result = nullptr;
  outcome.done = VELKDBExecute(database.handle(), sql, &result) == 0;
  if (!outcome.done) outcome.error = database.Error();
  if (result != nullptr) outcome.columns = plain.columns;  // fetched by them, so found or not
  unsigned int row = 0;
  while (VELKDBFetchRow(result, &row) == 0) {
    outcome.rows.emplace_back();
    for (const std::string &column : plain.columns)
      outcome.rows.back().emplace_back(VELKDBFetchField(result, row, column.c_str()));
  }
  VELKDBFreeResult(result);
  return outcome;
}

// Of columns with equal names the platform gives the first.
void GiveFirstOfEqualNames(Outcome &outcome) {
  for (size_t column = 0; column < outcome.columns.size(); ++column) {
    size_t first = 0;
    while (sqlite3_stricmp(outcome.columns[first].c_str(), outcome.columns[column].c_str()) != 0)
      ++first;
    for (auto &row : outcome.rows) row[column] = row[first];
  }
}

// All that a database holds, with the storage class of each value.
std::vector<std::vector<std::string>> Content(const std::string &path) {
  RawDatabase database(path);
  auto content = database.Rows("SELECT type, name, sql FROM sqlite_master ORDER BY name");
  for (const auto &table : database.Rows("SELECT name FROM sqlite_master WHERE type = 'table'")) {
    std::string columns;
    for (const auto &column :
         database.Rows("SELECT name FROM pragma_table_info('" + table[0] + "')"))
      columns += (columns.empty() ? "quote(" : ", quote(") + column[0] + ")";
    const auto rows = database.Rows("SELECT " + columns + " FROM " + table[0]);
    content.insert(content.end(), rows.begin(), rows.end());
  }
  return content;
}

TEST(VelkDbBesidePlainSqlite, AHundredThousandStatementsGiveTheSame) {
  constexpr int kStatements = 100000;
  constexpr int kStatementsOfATable = 2000;
  TempDir folder;
  const std::string path = folder.File("platform.db");
  const std::string plain_path = folder.File("plain.db");
  velk_test::MakeSharingDatabase(path);
  velk_test::MakeSharingDatabase(plain_path);
  VelkDbConnection database(path);
  PlainDatabase plain(plain_path);
  StatementGenerator generator(20261121);

  int succeeded = 0;
  for (int i = 0; i < kStatements; ++i) {
    std::string sql = generator.Next();
    if (i % kStatementsOfATable == 0) {
      plain.Run("ROLLBACK");
      database.Run("ROLLBACK");
      ASSERT_EQ(Content(path), Content(plain_path)) << "before statement " << i;
      sql = StatementGenerator::Setup();
    } else if (i % 97 == 0) {
      sql = generator.SchemaChange();
    } else if (i % 89 == 0 && !plain.InTransaction()) {
      const std::string change = generator.SchemaChange();
      // By others; ALTER TABLE may find its column there.
      PlainDatabase(path).Run(change.c_str());
      PlainDatabase(plain_path).Run(change.c_str());
    }
    Outcome expected = plain.Run(sql.c_str());
    GiveFirstOfEqualNames(expected);
    const Outcome outcome = RunThroughPlatform(database, sql.c_str(), expected);
    ASSERT_EQ(outcome.done, expected.done) << sql << "\n" << outcome.error << expected.error;
    ASSERT_EQ(outcome.error, expected.error) << sql;
    if (!expected.done) continue;
    ASSERT_EQ(outcome.columns, expected.columns) << sql;
    ASSERT_EQ(outcome.rows, expected.rows) << sql;
    ++succeeded;
  }
  EXPECT_GT(succeeded, kStatements / 2);  // else the generator is no use
}

}  // namespace
