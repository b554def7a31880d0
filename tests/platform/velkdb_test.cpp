#include "velk/velkdb.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <climits>
#include <filesystem>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "support/process.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velkdb_connection.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using velk_test::RawDatabase;
using velk_test::RunForked;
using velk_test::RunForkedTogether;
using velk_test::TempDir;
using velk_test::VelkDbConnection;
using velk_test::WriteFile;

constexpr unsigned int kNobody = 65534;

double SecondsSince(std::chrono::steady_clock::time_point start) {
  return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

// A folder with an SQLite file that holds the table item, on WAL.
class VelkDb : public testing::Test {
 protected:
  VelkDb() {
    RawDatabase(path_).Run(
        "PRAGMA journal_mode = WAL; CREATE TABLE item (id INTEGER PRIMARY KEY, name TEXT UNIQUE)");
  }

  TempDir folder_;
  std::string path_ = folder_.File("test.db");
};

// All values of a column.
std::vector<std::string> Column(VelkDbConnection &database, const std::string &sql,
                                const char *column) {
  std::vector<std::string> values;
  DBResult *result = nullptr;
  EXPECT_EQ(VELKDBExecute(database.handle(), sql.c_str(), &result), 0) << database.Error();
  unsigned int row = 0;
  while (VELKDBFetchRow(result, &row) != -1)
    values.emplace_back(VELKDBFetchField(result, row, column));
  VELKDBFreeResult(result);
  return values;
}

// ---- Connect

TEST_F(VelkDb, ConnectsToAnExistingFile) {
  EXPECT_TRUE(VelkDbConnection(path_).IsOpen());
}

TEST_F(VelkDb, ConnectIgnoresHostUserAndPassword) {
  VELKDBHandle *handle = VELKDBConnect(nullptr, "anyone", "anything", path_.c_str());
  EXPECT_NE(handle, nullptr);
  VELKDBClose(handle);
}

TEST_F(VelkDb, ConnectRefusesANullOrEmptyPath) {
  EXPECT_EQ(VELKDBConnect("", "", "", nullptr), nullptr);
  EXPECT_EQ(VELKDBConnect("", "", "", ""), nullptr);
}

TEST_F(VelkDb, ConnectNeitherOpensNorCreatesAMissingFile) {
  EXPECT_FALSE(VelkDbConnection(folder_.File("missing.db")).IsOpen());
  EXPECT_FALSE(std::filesystem::exists(folder_.File("missing.db")));
  EXPECT_FALSE(VelkDbConnection(folder_.File("missing/test.db")).IsOpen());
}

TEST_F(VelkDb, ConnectRefusesAFolder) {
  EXPECT_FALSE(VelkDbConnection(folder_.path()).IsOpen());
  EXPECT_FALSE(VelkDbConnection(folder_.path() + "/").IsOpen());
  EXPECT_FALSE(VelkDbConnection(folder_.path() + "/.").IsOpen());
}

TEST_F(VelkDb, ConnectRefusesASymbolicLinkAtTheLastStep) {
  std::filesystem::create_symlink(path_, folder_.File("link.db"));
  EXPECT_FALSE(VelkDbConnection(folder_.File("link.db")).IsOpen());
}

TEST_F(VelkDb, ConnectFollowsSymbolicLinksInTheDirectoryPart) {
  std::filesystem::create_directory_symlink(folder_.path(), folder_.File("here"));
  VelkDbConnection database(folder_.File("here/test.db"));
  ASSERT_TRUE(database.IsOpen());
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM item", "c"), "0");
}

TEST_F(VelkDb, ConnectTakesAPathRelativeToTheWorkingDirectory) {
  EXPECT_EQ(RunForked([this] {
              if (chdir(folder_.path().c_str()) != 0) return 1;
              return VelkDbConnection("test.db").IsOpen() && VelkDbConnection("./test.db").IsOpen()
                         ? 0
                         : 2;
            }),
            0);
}

TEST_F(VelkDb, ConnectTakesSpecialNamesAsNames) {
  std::filesystem::copy_file(path_, folder_.File(":memory:"));
  VelkDbConnection database(folder_.File(":memory:"));
  ASSERT_TRUE(database.IsOpen());
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM item", "c"), "0");
  EXPECT_EQ(RunForked([this] {
              if (chdir(folder_.path().c_str()) != 0) return 1;
              return VelkDbConnection("file:test.db?mode=rwc").IsOpen() ? 2 : 0;
            }),
            0);
}

TEST_F(VelkDb, ConnectOpensTheLogWhileTheCallerIsStillWhoHeIs) {
  VelkDbConnection database(path_);
  EXPECT_TRUE(std::filesystem::exists(path_ + "-wal"));
}

TEST_F(VelkDb, DistrustsTheSchema) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("PRAGMA trusted_schema", "trusted_schema"), "0");
  database.Run("PRAGMA writable_schema = ON");
  EXPECT_EQ(database.Run("DELETE FROM sqlite_schema"), -1);
}

TEST_F(VelkDb, RunsWithSynchronousNormal) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("PRAGMA synchronous", "synchronous"), "1");
}

// ---- Execute

TEST_F(VelkDb, RunsEveryStatementOfAScript) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (1, 'a'); -- a comment; with a semicolon\n"
                         "INSERT INTO item VALUES (2, 'b');;\n"
                         "INSERT INTO item VALUES (3, 'c') -- the end"),
            0);
  EXPECT_THAT(Column(database, "SELECT name FROM item ORDER BY id", "name"),
              ElementsAre("a", "b", "c"));
}

TEST_F(VelkDb, StopsAtTheFirstStatementThatFails) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (1, 'a'); INSERT INTO nowhere VALUES (1);"
                         "INSERT INTO item VALUES (2, 'b')"),
            -1);
  EXPECT_EQ(database.Error(), "no such table: nowhere");
  EXPECT_THAT(Column(database, "SELECT name FROM item", "name"), ElementsAre("a"));
}

TEST_F(VelkDb, AnEmptyTextSucceedsWithoutAResult) {
  VelkDbConnection database(path_);
  for (const char *sql : {"", "  \n", "-- nothing", ";;"}) {
    DBResult *result = reinterpret_cast<DBResult *>(&database);
    EXPECT_EQ(VELKDBExecute(database.handle(), sql, &result), 0) << sql;
    EXPECT_EQ(result, nullptr) << sql;
  }
}

TEST_F(VelkDb, NullArgumentsFail) {
  DBResult *result = reinterpret_cast<DBResult *>(this);
  EXPECT_EQ(VELKDBExecute(nullptr, "SELECT 1", &result), -1);
  EXPECT_EQ(result, nullptr);
  VelkDbConnection database(path_);
  EXPECT_EQ(VELKDBExecute(database.handle(), nullptr, nullptr), -1);
  EXPECT_EQ(database.Error(), "no statement given");
  EXPECT_STREQ(VELKDBErrorGet(nullptr), "");
  EXPECT_EQ(VELKDBSqlite(nullptr), nullptr);
  VELKDBClose(nullptr);
  VELKDBFreeResult(nullptr);
}

TEST_F(VelkDb, GivesTheRowsOfTheLastStatementWithColumns) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("SELECT 1 AS v; SELECT 2 AS v; INSERT INTO item VALUES (1, 'a')", "v"),
            "2");
}

TEST_F(VelkDb, AQueryWithoutRowsGivesAnEmptyResult) {
  VelkDbConnection database(path_);
  DBResult *result = nullptr;
  ASSERT_EQ(VELKDBExecute(database.handle(), "SELECT * FROM item", &result), 0);
  ASSERT_NE(result, nullptr);
  unsigned int row = 7;
  EXPECT_EQ(VELKDBFetchRow(result, &row), -1);
  EXPECT_EQ(row, 7U);
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, AStatementWithoutColumnsGivesNoResult) {
  VelkDbConnection database(path_);
  DBResult *result = reinterpret_cast<DBResult *>(&database);
  EXPECT_EQ(VELKDBExecute(database.handle(), "DELETE FROM item", &result), 0);
  EXPECT_EQ(result, nullptr);
}

TEST_F(VelkDb, FailureGivesNoResult) {
  VelkDbConnection database(path_);
  DBResult *result = reinterpret_cast<DBResult *>(&database);
  EXPECT_EQ(VELKDBExecute(database.handle(), "SELECT 1; SELECT nonsense FROM item", &result), -1);
  EXPECT_EQ(result, nullptr);
}

TEST_F(VelkDb, RunsStatementsWhoseRowsNobodyWants) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (1, 'a'), (2, 'b') RETURNING id"), 0);
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM item", "c"), "2");
}

TEST_F(VelkDb, SeesColumnsThatAnotherConnectionAdded) {
  VelkDbConnection database(path_);
  database.Run("INSERT INTO item VALUES (1, 'a')");
  EXPECT_EQ(database.Value("SELECT * FROM item", "note"), "");
  RawDatabase(path_).Run("ALTER TABLE item ADD COLUMN note TEXT DEFAULT 'new'");
  EXPECT_EQ(database.Value("SELECT * FROM item", "note"), "new");
}

TEST_F(VelkDb, KeepsATenMegabyteValue) {
  VelkDbConnection database(path_);
  const std::string value(10 * 1024 * 1024, 'x');
  ASSERT_EQ(database.Run("INSERT INTO item VALUES (1, '" + value + "')"), 0);
  EXPECT_TRUE(database.Value("SELECT name FROM item", "name") == value);
}

TEST_F(VelkDb, KeepsBytesThatAreNotUtf8) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("INSERT INTO item VALUES (1, 'a\xFF\xC3(\x80')"), 0);
  EXPECT_EQ(database.Value("SELECT name FROM item", "name"), "a\xFF\xC3(\x80");
}

TEST_F(VelkDb, AValueIsCutAtItsZeroByte) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("SELECT 'a' || char(0) || 'b' AS v, 'next' AS w", "v"), "a");
  EXPECT_EQ(database.Value("SELECT 'a' || char(0) || 'b' AS v, 'next' AS w", "w"), "next");
}

TEST_F(VelkDb, ResultsHoldNoLockAndOutliveTheConnection) {
  DBResult *result = nullptr;
  {
    VelkDbConnection database(path_);
    database.Run("INSERT INTO item VALUES (1, 'a'), (2, 'b')");
    ASSERT_EQ(VELKDBExecute(database.handle(), "SELECT name FROM item ORDER BY id", &result), 0);
    RawDatabase(path_).Run(
        "PRAGMA busy_timeout = 0; PRAGMA wal_checkpoint(TRUNCATE);"
        "DROP TABLE item");
  }
  unsigned int row = 0;
  ASSERT_EQ(VELKDBFetchRow(result, &row), 0);
  ASSERT_EQ(VELKDBFetchRow(result, &row), 0);
  EXPECT_STREQ(VELKDBFetchField(result, row, "name"), "b");
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, AnErrorInTheMiddleOfAScanFailsTheCall) {
  const std::string path = folder_.File("broken.db");
  {
    RawDatabase raw(path);
    raw.Run("CREATE TABLE big (id INTEGER PRIMARY KEY, fill TEXT)");
    for (int i = 0; i < 100; ++i) raw.Run("INSERT INTO big VALUES (NULL, hex(randomblob(1000)))");
  }
  std::string bytes = velk_test::ReadFile(path);
  const size_t page = 4096;
  bytes.replace(bytes.size() - 3 * page, page, page, '\xEE');
  velk_test::WriteFile(path, bytes);

  VelkDbConnection database(path);
  ASSERT_TRUE(database.IsOpen());
  EXPECT_EQ(Column(database, "SELECT id FROM big LIMIT 10", "id").size(), 10U);
  DBResult *result = reinterpret_cast<DBResult *>(&database);
  EXPECT_EQ(VELKDBExecute(database.handle(), "SELECT * FROM big", &result), -1);
  EXPECT_EQ(result, nullptr);
  EXPECT_EQ(database.Error(), "database disk image is malformed");
}

TEST_F(VelkDb, AFileThatIsNoDatabaseFailsTheFirstStatement) {
  velk_test::WriteFile(folder_.File("text.db"), std::string(5000, 't'));
  VelkDbConnection database(folder_.File("text.db"));
  ASSERT_TRUE(database.IsOpen());
  EXPECT_EQ(database.Run("SELECT * FROM sqlite_schema"), -1);
  EXPECT_EQ(database.Error(), "file is not a database");
}

TEST_F(VelkDb, LackOfMemoryFailsTheCallAndNotTheProcess) {
  EXPECT_EQ(
      RunForked([this] {
        VelkDbConnection database(path_);
        sqlite3_hard_heap_limit64(sqlite3_memory_used() + 1024 * 1024);
        DBResult *result = nullptr;
        const char *sql = "SELECT hex(zeroblob(20000000)) AS v";
        if (VELKDBExecute(database.handle(), sql, &result) != -1) return 1;
        if (database.Error() != "out of memory") return 2;
        sqlite3_hard_heap_limit64(0);
        return database.Value("SELECT length(hex(zeroblob(20000000))) AS n", "n") == "40000000" ? 0
                                                                                                : 3;
      }),
      0);
}

// ---- Errors

TEST_F(VelkDb, TheErrorTextIsEmptyBeforeTheFirstFailureAndStaysAfterASuccess) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Error(), "");
  ASSERT_EQ(database.Run("nonsense"), -1);
  EXPECT_EQ(database.Error(), "near \"nonsense\": syntax error");
  ASSERT_EQ(database.Run("SELECT 1"), 0);
  EXPECT_EQ(database.Error(), "near \"nonsense\": syntax error");
}

TEST_F(VelkDb, ABrokenConstraintIsNamedInTheErrorText) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("INSERT INTO item VALUES (1, 'a')"), 0);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (2, 'a')"), -1);
  EXPECT_EQ(database.Error(), "UNIQUE constraint failed: item.name");
}

// ---- Transactions

TEST_F(VelkDb, AFailingScriptLeavesNoTransactionThatItOpened) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("BEGIN; INSERT INTO item VALUES (1, 'a'); nonsense"), -1);
  EXPECT_THAT(database.Error(), HasSubstr("nonsense"));
  EXPECT_EQ(sqlite3_get_autocommit(VELKDBSqlite(database.handle())), 1);
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM item", "c"), "0");
}

TEST_F(VelkDb, AFailingScriptLeavesNoSavepointThatItOpened) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("SAVEPOINT here; INSERT INTO item VALUES (1, 'a'); nonsense"), -1);
  EXPECT_EQ(sqlite3_get_autocommit(VELKDBSqlite(database.handle())), 1);
}

TEST_F(VelkDb, AFailingStatementKeepsTheCallersTransactionOpen) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("BEGIN TRANSACTION"), 0);
  ASSERT_EQ(database.Run("INSERT INTO item VALUES (1, 'a')"), 0);
  EXPECT_EQ(database.Run("nonsense"), -1);
  EXPECT_EQ(database.Run("BEGIN TRANSACTION"), -1);
  EXPECT_EQ(database.Run("COMMIT"), 0);
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM item", "c"), "1");
}

TEST_F(VelkDb, ATransactionOpenedAfterTheCallersOwnIsRolledBackOnFailure) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("BEGIN; INSERT INTO item VALUES (1, 'a')"), 0);
  EXPECT_EQ(database.Run("COMMIT; BEGIN; INSERT INTO item VALUES (2, 'b'); nonsense"), -1);
  EXPECT_EQ(sqlite3_get_autocommit(VELKDBSqlite(database.handle())), 1);
  EXPECT_THAT(Column(database, "SELECT name FROM item", "name"), ElementsAre("a"));
}

TEST_F(VelkDb, AScriptMayLeaveATransactionOpen) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("BEGIN; INSERT INTO item VALUES (1, 'a')"), 0);
  EXPECT_EQ(sqlite3_get_autocommit(VELKDBSqlite(database.handle())), 0);
}

TEST_F(VelkDb, CloseRollsAnOpenTransactionBack) {
  { VelkDbConnection(path_).Run("BEGIN; INSERT INTO item VALUES (1, 'a')"); }
  EXPECT_EQ(RawDatabase(path_).Value("SELECT COUNT(*) FROM item"), "0");
}

// ---- Fetch

TEST_F(VelkDb, FindsColumnsByNameInAnyOrderAndCase) {
  VelkDbConnection database(path_);
  DBResult *result = nullptr;
  ASSERT_EQ(VELKDBExecute(database.handle(),
                          "SELECT 1 AS a, 2 AS b, 3 AS c UNION ALL SELECT 4, 5, 6", &result),
            0);
  unsigned int row = 9;
  ASSERT_EQ(VELKDBFetchRow(result, &row), 0);
  EXPECT_EQ(row, 0U);
  EXPECT_STREQ(VELKDBFetchField(result, row, "c"), "3");
  EXPECT_STREQ(VELKDBFetchField(result, row, "a"), "1");
  EXPECT_STREQ(VELKDBFetchField(result, row, "B"), "2");
  EXPECT_STREQ(VELKDBFetchField(result, row, "b"), "2");
  ASSERT_EQ(VELKDBFetchRow(result, &row), 0);
  EXPECT_EQ(row, 1U);
  EXPECT_STREQ(VELKDBFetchField(result, row, "C"), "6");
  EXPECT_STREQ(VELKDBFetchField(result, 0, "a"), "1");
  EXPECT_EQ(VELKDBFetchRow(result, &row), -1);
  EXPECT_EQ(VELKDBFetchRow(result, &row), -1);
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, OfEqualColumnNamesTheFirstIsFound) {
  VelkDbConnection database(path_);
  DBResult *result = nullptr;
  ASSERT_EQ(VELKDBExecute(database.handle(), "SELECT 1 AS a, 2 AS b, 3 AS A", &result), 0);
  EXPECT_STREQ(VELKDBFetchField(result, 0, "b"), "2");
  EXPECT_STREQ(VELKDBFetchField(result, 0, "a"), "1");
  EXPECT_STREQ(VELKDBFetchField(result, 0, "A"), "1");
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, NullValuesUnknownColumnsAndUnknownRowsAreEmptyTexts) {
  VelkDbConnection database(path_);
  DBResult *result = nullptr;
  ASSERT_EQ(VELKDBExecute(database.handle(), "SELECT NULL AS a, 'x' AS b", &result), 0);
  EXPECT_STREQ(VELKDBFetchField(result, 0, "a"), "");
  EXPECT_STREQ(VELKDBFetchField(result, 0, "b"), "x");
  EXPECT_STREQ(VELKDBFetchField(result, 0, "c"), "");
  EXPECT_STREQ(VELKDBFetchField(result, 0, ""), "");
  EXPECT_STREQ(VELKDBFetchField(result, 1, "b"), "");
  EXPECT_STREQ(VELKDBFetchField(result, UINT_MAX, "b"), "");
  EXPECT_STREQ(VELKDBFetchField(result, 0, nullptr), "");
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, FetchingFromNothingGivesNothing) {
  unsigned int row = 7;
  EXPECT_EQ(VELKDBFetchRow(nullptr, &row), -1);
  EXPECT_EQ(row, 7U);
  EXPECT_STREQ(VELKDBFetchField(nullptr, 0, "a"), "");
  VelkDbConnection database(path_);
  DBResult *result = nullptr;
  ASSERT_EQ(VELKDBExecute(database.handle(), "SELECT 1", &result), 0);
  EXPECT_EQ(VELKDBFetchRow(result, nullptr), -1);
  VELKDBFreeResult(result);
}

TEST_F(VelkDb, PragmaColumnsHaveThePragmasName) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("PRAGMA user_version = 7"), 0);
  EXPECT_EQ(database.Value("PRAGMA user_version", "user_version"), "7");
}

TEST_F(VelkDb, NumbersAndBlobsComeAsText) {
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("SELECT -9223372036854775808 AS v", "v"), "-9223372036854775808");
  EXPECT_EQ(database.Value("SELECT 0.25 AS v", "v"), "0.25");
  EXPECT_EQ(database.Value("SELECT x'6162' AS v", "v"), "ab");
}

// ---- The connection beneath

TEST_F(VelkDb, TheConnectionBeneathTellsTheLastInsertedRow) {
  VelkDbConnection database(path_);
  database.Run("INSERT INTO item VALUES (41, 'a')");
  EXPECT_EQ(sqlite3_last_insert_rowid(VELKDBSqlite(database.handle())), 41);
}

// ---- Permissions and a full disk

// Runs `body` as an account without rights; gives what it returned.
int RunAsNobody(const std::function<int()> &body) {
  return RunForked([&body] {
    if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) return 100;
    return body();
  });
}

TEST_F(VelkDb, AnEmptyFileIsSwitchedToWal) {
  const std::string path = folder_.File("empty.db");
  WriteFile(path, "");
  VelkDbConnection database(path);
  EXPECT_EQ(database.Value("PRAGMA journal_mode", "journal_mode"), "wal");
}

TEST_F(VelkDb, AnEmptyFileCanBeFilledByAnAccountThatCouldNotHaveOpenedIt) {
  if (geteuid() != 0) GTEST_SKIP() << "needs root";
  const std::string path = folder_.File("empty.db");
  WriteFile(path, "");
  chmod(path.c_str(), 0600);
  EXPECT_EQ(
      RunForked([&path] {
        VelkDbConnection database(path);
        if (!database.IsOpen() || setgid(kNobody) != 0 || setuid(kNobody) != 0) return 1;
        return database.Run("CREATE TABLE item (name); INSERT INTO item VALUES ('a')") == 0 ? 0 : 2;
      }),
      0);
  EXPECT_EQ(RawDatabase(path).Value("SELECT name FROM item"), "a");
}

TEST_F(VelkDb, AFileThatMayOnlyBeReadIsReadAndNotWritten) {
  const std::string path = folder_.File("fixed.db");
  RawDatabase(path).Run("CREATE TABLE item (name); INSERT INTO item VALUES ('a')");
  chmod(path.c_str(), 0444);
  chmod(folder_.path().c_str(), 0555);
  EXPECT_EQ(RunAsNobody([&path] {
              VelkDbConnection database(path);
              if (!database.IsOpen()) return 1;
              if (database.Value("SELECT name FROM item", "name") != "a") return 2;
              if (database.Run("INSERT INTO item VALUES ('b')") != -1) return 3;
              return database.Error() == "attempt to write a readonly database" ? 0 : 4;
            }),
            0);
  chmod(folder_.path().c_str(), 0755);
}

TEST_F(VelkDb, AFileThatMayNotBeReadIsNotConnectedTo) {
  chmod(folder_.path().c_str(), 0755);
  chmod(path_.c_str(), 0000);
  EXPECT_EQ(RunAsNobody([this] { return VelkDbConnection(path_).IsOpen() ? 1 : 0; }), 0);
}

TEST_F(VelkDb, AFolderThatMayNotBeEnteredIsNotConnectedTo) {
  chmod(folder_.path().c_str(), 0000);
  EXPECT_EQ(RunAsNobody([this] { return VelkDbConnection(path_).IsOpen() ? 1 : 0; }), 0);
  chmod(folder_.path().c_str(), 0755);
}

TEST_F(VelkDb, AFullDiskFailsTheStatementAndLosesNothing) {
  EXPECT_EQ(RunForked([this] {
              VelkDbConnection database(path_);
              if (database.Run("INSERT INTO item VALUES (1, 'a')") != 0) return 1;
              signal(SIGXFSZ, SIG_IGN);
              const rlimit limit{256 * 1024, 256 * 1024};
              if (setrlimit(RLIMIT_FSIZE, &limit) != 0) return 2;
              const std::string big(1024 * 1024, 'x');
              if (database.Run("INSERT INTO item VALUES (2, '" + big + "')") != -1) return 3;
              if (database.Error().empty()) return 4;
              return database.Run("INSERT INTO item VALUES (3, 'c')") == 0 ? 0 : 5;
            }),
            0);
  RawDatabase raw(path_);
  EXPECT_EQ(raw.Value("SELECT group_concat(name) FROM item"), "a,c");
  EXPECT_EQ(raw.Value("PRAGMA integrity_check"), "ok");
}

// ---- Other processes

TEST_F(VelkDb, WaitsForAnotherConnectionsWriteLock) {
  RawDatabase other(path_);
  other.Run("BEGIN IMMEDIATE");
  const auto start = std::chrono::steady_clock::now();
  std::thread releaser([&other] {
    std::this_thread::sleep_for(std::chrono::seconds(1));
    other.Run("COMMIT");
  });
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (1, 'a')"), 0) << database.Error();
  EXPECT_GE(SecondsSince(start), 1);
  releaser.join();
}

TEST_F(VelkDb, WaitsForALockThatSqliteItselfDoesNotWaitFor) {
  const std::string path = folder_.File("rollback.db");
  RawDatabase other(path);
  other.Run("CREATE TABLE item (name); BEGIN IMMEDIATE");  // bars the switch to WAL
  std::thread releaser([&other] {
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    other.Run("COMMIT");
  });
  VelkDbConnection database(path);
  EXPECT_EQ(database.Value("PRAGMA journal_mode = WAL", "journal_mode"), "wal") << database.Error();
  releaser.join();
}

TEST_F(VelkDb, GivesUpOnALockAfterTenSeconds) {
  RawDatabase other(path_);
  other.Run("BEGIN IMMEDIATE");
  VelkDbConnection database(path_);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (1, 'a')"), -1);
  EXPECT_EQ(database.Error(), "database is locked");
  EXPECT_GT(SecondsSince(start), 9.5);
  EXPECT_LT(SecondsSince(start), 15);
}

TEST_F(VelkDb, AChangeThatCannotBeMadeOnAnOldSnapshotFailsAtOnce) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run("BEGIN; SELECT * FROM item"), 0);
  RawDatabase(path_).Run("INSERT INTO item VALUES (1, 'a')");
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (2, 'b')"), -1);
  EXPECT_LT(SecondsSince(start), 5);
  EXPECT_EQ(database.Run("ROLLBACK"), 0);
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (2, 'b')"), 0);
}

TEST_F(VelkDb, ManyProcessesWriteAtOnceAndNoneFails) {
  const int processes = 16;
  const int rows = 50;
  const std::vector<int> statuses = RunForkedTogether(processes, [this](int number) {
    VelkDbConnection database(path_);
    for (int i = 0; i < rows; ++i) {
      const std::string name = std::to_string(number) + "-" + std::to_string(i);
      if (database.Run("INSERT INTO item VALUES (NULL, '" + name + "')") != 0) return 1;
    }
    return 0;
  });
  EXPECT_THAT(statuses, testing::Each(0));
  EXPECT_EQ(RawDatabase(path_).Value("SELECT COUNT(*) FROM item"),
            std::to_string(processes * rows));
}

TEST_F(VelkDb, ACommittedChangeSurvivesTheDeathOfItsProcess) {
  EXPECT_EQ(RunForked([this] {
              VelkDbConnection database(path_);
              database.Run("INSERT INTO item VALUES (1, 'a')");
              return raise(SIGKILL);
            }),
            128 + SIGKILL);
  VelkDbConnection database(path_);
  EXPECT_EQ(database.Value("SELECT name FROM item", "name"), "a");
}

TEST_F(VelkDb, AKilledProcessLeavesNeitherItsTransactionNorItsLock) {
  EXPECT_EQ(RunForked([this] {
              VelkDbConnection database(path_);
              database.Run("BEGIN IMMEDIATE; INSERT INTO item VALUES (1, 'a')");
              return raise(SIGKILL);
            }),
            128 + SIGKILL);
  VelkDbConnection database(path_);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(database.Run("INSERT INTO item VALUES (2, 'b')"), 0) << database.Error();
  EXPECT_LT(SecondsSince(start), 5);
  EXPECT_THAT(Column(database, "SELECT name FROM item", "name"), ElementsAre("b"));
}

// ---- Escape

// The escaped text, or "(failed)".
std::string Escaped(const std::string &text, size_t capacity) {
  std::vector<char> out(capacity + 1, '?');
  const int written = VELKDBEscapeStringEX2(0, out.data(), capacity, text.data(), text.size());
  EXPECT_EQ(out[capacity], '?') << "written past the capacity";
  return written < 0 ? "(failed)" : std::string(out.data(), static_cast<size_t>(written));
}

TEST(VelkDbEscape, DoublesSingleQuotesAndChangesNothingElse) {
  EXPECT_EQ(Escaped("O'Brien", 14), "O''Brien");
  EXPECT_EQ(Escaped("'", 2), "''");
  EXPECT_EQ(Escaped("'a''b'", 12), "''a''''b''");
  EXPECT_EQ(Escaped("\"\\%`\n\xFF", 12), "\"\\%`\n\xFF");
}

TEST(VelkDbEscape, CopiesZeroBytes) {
  EXPECT_EQ(Escaped(std::string("a\0'b", 4), 8), std::string("a\0''b", 5));
}

TEST(VelkDbEscape, TwiceTheLengthAlwaysSuffices) {
  EXPECT_EQ(Escaped("''''", 8), "''''''''");
}

TEST(VelkDbEscape, FailsWhenTheTextDoesNotFit) {
  EXPECT_EQ(Escaped("abc", 2), "(failed)");
  EXPECT_EQ(Escaped("a'b", 3), "(failed)");
  EXPECT_EQ(Escaped("a'b", 4), "a''b");
}

TEST(VelkDbEscape, TerminatesTheTextWhereThereIsRoom) {
  char out[4] = {'?', '?', '?', '?'};
  EXPECT_EQ(VELKDBEscapeStringEX2(0, out, 3, "ab", 2), 2);
  EXPECT_EQ(out[2], '\0');
  EXPECT_EQ(out[3], '?');
  EXPECT_EQ(VELKDBEscapeStringEX2(0, out, 2, "xy", 2), 2);
  EXPECT_EQ(std::string(out, 2), "xy");
}

TEST(VelkDbEscape, AnEmptyTextNeedsNoMemory) {
  EXPECT_EQ(VELKDBEscapeStringEX2(0, nullptr, 0, nullptr, 0), 0);
  EXPECT_EQ(VELKDBEscapeStringEX2(0, nullptr, 5, "", 0), 0);
  char out = '?';
  EXPECT_EQ(VELKDBEscapeStringEX2(0, &out, 1, nullptr, 0), 0);
  EXPECT_EQ(out, '\0');
}

TEST(VelkDbEscape, RefusesNullPointersAndLengthsItCannotReport) {
  char out[4];
  EXPECT_EQ(VELKDBEscapeStringEX2(0, nullptr, 4, "a", 1), -1);
  EXPECT_EQ(VELKDBEscapeStringEX2(0, out, sizeof out, nullptr, 1), -1);
  EXPECT_EQ(VELKDBEscapeStringEX2(0, out, sizeof out, "a", size_t{INT_MAX} + 1), -1);
}

TEST(VelkDbEscape, TenMegabytesOfQuotesNeedNoStack) {
  const std::string text(10 * 1024 * 1024, '\'');
  EXPECT_EQ(Escaped(text, 2 * text.size()).size(), 2 * text.size());
}

}  // namespace
