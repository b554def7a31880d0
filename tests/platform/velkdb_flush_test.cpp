// Which statements wait for the disk: counted where SQLite hands the flush to the system.

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <filesystem>
#include <memory>
#include <string>

#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velkdb_connection.h"

namespace {

using velk_test::RawDatabase;
using velk_test::TempDir;
using velk_test::VelkDbConnection;

int log_flushes = 0;
bool disk_is_broken = false;
const sqlite3_io_methods *log_methods = nullptr;  // the system's own
sqlite3_io_methods counting_methods;

int CountFlush(sqlite3_file *file, int flags) {
  ++log_flushes;
  return disk_is_broken ? SQLITE_IOERR_FSYNC : log_methods->xSync(file, flags);
}

int OpenCounted(sqlite3_vfs * /*vfs*/, const char *name, sqlite3_file *file, int flags,
                int *out_flags) {
  sqlite3_vfs *system = sqlite3_vfs_find("unix");
  const int outcome = system->xOpen(system, name, file, flags, out_flags);
  if (outcome != SQLITE_OK || (flags & SQLITE_OPEN_WAL) == 0) return outcome;
  log_methods = file->pMethods;
  counting_methods = *log_methods;
  counting_methods.xSync = CountFlush;
  file->pMethods = &counting_methods;
  return outcome;
}

// From here on SQLite opens every file of this process through OpenCounted().
void CountFlushesOfLogs() {
  static sqlite3_vfs counting = *sqlite3_vfs_find("unix");
  counting.zName = "counting";
  counting.xOpen = OpenCounted;
  ASSERT_EQ(sqlite3_vfs_register(&counting, 1), SQLITE_OK);
}

// A sharing database with one row in each table, and a connection to it.
class VelkDbFlush : public testing::Test {
 protected:
  static void SetUpTestSuite() { CountFlushesOfLogs(); }

  VelkDbFlush() {
    velk_test::MakeSharingDatabase(path_);
    RawDatabase(path_).Run(
        "INSERT INTO entry VALUES (NULL, 'hash', 'photo', 1, 1000, 0, 0, 0, 0, 0, '{}');"
        "INSERT INTO session VALUES (NULL, 'visitor', 1000, '192.0.2.7', 4102444800);"
        "INSERT INTO token VALUES (NULL, 1, 1, 4102444800)");
    Connect();
  }

  void Connect() {
    connection_ = std::make_unique<VelkDbConnection>(path_);
    // SQLite flushes a new log's head whoever writes; not what is counted here.
    Run("UPDATE entry SET use_count = use_count + 1");
    log_flushes = 0;
  }

  void Run(const std::string &sql) { ASSERT_EQ(connection_->Run(sql), 0) << connection_->Error(); }

  // How often the log is flushed by `sql`.
  int FlushesOf(const std::string &sql) {
    log_flushes = 0;
    Run(sql);
    return log_flushes;
  }

  TempDir folder_;
  std::string path_ = folder_.File("sharing.db");
  std::unique_ptr<VelkDbConnection> connection_;
};

constexpr char kNewEntry[] =
    "INSERT INTO entry VALUES (NULL,'new','photo','1','1000','0','0','0','0','0','{}')";
constexpr char kNewSession[] = "INSERT INTO session VALUES (NULL,'new','1000','::1','4102444800')";
constexpr char kNewToken[] = "INSERT INTO token VALUES (NULL,'7','7','4102444800')";

TEST_F(VelkDbFlush, EveryChangeOfALinkIsFlushedOnce) {
  EXPECT_EQ(FlushesOf(kNewEntry), 1);
  EXPECT_EQ(FlushesOf("UPDATE entry SET use_count='5' WHERE id=1"), 1);
  EXPECT_EQ(FlushesOf("DELETE FROM entry WHERE id=2"), 1);
}

TEST_F(VelkDbFlush, NewSessionsAndGrantsAreNotFlushed) {
  EXPECT_EQ(FlushesOf(kNewSession), 0);
  EXPECT_EQ(FlushesOf(kNewToken), 0);
}

TEST_F(VelkDbFlush, TimeoutsPushedForwardAreNotFlushed) {
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='4102444801' WHERE id=1"), 0);
  EXPECT_EQ(FlushesOf("UPDATE token SET timeout='4102444801' WHERE id=1"), 0);
}

TEST_F(VelkDbFlush, EveryDeletionIsFlushed) {
  EXPECT_EQ(FlushesOf("DELETE FROM session WHERE id=1"), 1);
  EXPECT_EQ(FlushesOf("DELETE FROM token WHERE entry_id = 1"), 1);
}

TEST_F(VelkDbFlush, ADeletionWithNothingToDeleteIsNotFlushed) {
  EXPECT_EQ(FlushesOf("DELETE FROM session WHERE id=99"), 0);
}

TEST_F(VelkDbFlush, ReadingIsNotFlushed) {
  EXPECT_EQ(FlushesOf("SELECT * FROM entry; SELECT * FROM session; PRAGMA user_version"), 0);
}

TEST_F(VelkDbFlush, ATransactionWithALinkIsFlushedOnceAtItsCommit) {
  EXPECT_EQ(FlushesOf("BEGIN TRANSACTION"), 0);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
  EXPECT_EQ(FlushesOf(kNewEntry), 0);
  EXPECT_EQ(FlushesOf(kNewToken), 0);
  EXPECT_EQ(FlushesOf("COMMIT"), 1);
}

TEST_F(VelkDbFlush, ATransactionOfSessionsAndGrantsIsNotFlushed) {
  EXPECT_EQ(FlushesOf("BEGIN TRANSACTION"), 0);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
  EXPECT_EQ(FlushesOf(kNewToken), 0);
  EXPECT_EQ(FlushesOf("COMMIT"), 0);
}

TEST_F(VelkDbFlush, ATransactionThatHoldsTheWriteLockIsJudgedByItsRows) {
  for (const char *begin : {"BEGIN IMMEDIATE", "BEGIN EXCLUSIVE"}) {
    EXPECT_EQ(FlushesOf(begin), 0);
    EXPECT_EQ(FlushesOf("UPDATE session SET timeout='4102444801' WHERE id=1"), 0);
    EXPECT_EQ(FlushesOf("UPDATE token SET timeout='4102444801' WHERE id=1"), 0);
    EXPECT_EQ(FlushesOf("COMMIT"), 0) << begin;
  }
}

TEST_F(VelkDbFlush, ATransactionThatHoldsTheWriteLockIsFlushedWithADeletion) {
  EXPECT_EQ(FlushesOf("BEGIN IMMEDIATE"), 0);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
  EXPECT_EQ(FlushesOf("DELETE FROM token WHERE id=1"), 0);
  EXPECT_EQ(FlushesOf("COMMIT"), 1);
}

TEST_F(VelkDbFlush, ATransactionThatHoldsTheWriteLockIsFlushedWithALink) {
  EXPECT_EQ(FlushesOf("BEGIN IMMEDIATE"), 0);
  EXPECT_EQ(FlushesOf("UPDATE entry SET use_count='5' WHERE id=1"), 0);
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='4102444801' WHERE id=1"), 0);
  EXPECT_EQ(FlushesOf("COMMIT"), 1);
}

TEST_F(VelkDbFlush, ATransactionWithNothingInItIsNotFlushed) {
  EXPECT_EQ(FlushesOf("BEGIN IMMEDIATE; COMMIT"), 0);
  EXPECT_EQ(FlushesOf("BEGIN IMMEDIATE; SELECT * FROM entry; ROLLBACK"), 0);
}

TEST_F(VelkDbFlush, WhatOneTransactionWroteDoesNotCountForTheNext) {
  EXPECT_EQ(FlushesOf("BEGIN IMMEDIATE; DELETE FROM token WHERE id=1; COMMIT"), 1);
  EXPECT_EQ(FlushesOf(std::string("BEGIN IMMEDIATE;") + kNewToken + "; COMMIT"), 0);
}

TEST_F(VelkDbFlush, ATransactionRolledBackIsNotFlushedAndForgotten) {
  EXPECT_EQ(FlushesOf(std::string("BEGIN; ") + kNewEntry), 0);
  EXPECT_EQ(FlushesOf("ROLLBACK"), 0);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
}

TEST_F(VelkDbFlush, AFailedScriptIsForgotten) {
  log_flushes = 0;
  EXPECT_EQ(connection_->Run(std::string("BEGIN; ") + kNewEntry + "; nonsense"), -1);
  EXPECT_EQ(log_flushes, 0);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
}

TEST_F(VelkDbFlush, AReleasedOutermostSavepointIsFlushed) {
  EXPECT_EQ(FlushesOf(std::string("SAVEPOINT here; ") + kNewEntry), 0);
  EXPECT_EQ(FlushesOf("RELEASE here"), 1);
}

TEST_F(VelkDbFlush, EachStatementOfAScriptIsJudgedAlone) {
  const std::string script = std::string(kNewSession) + ";" + kNewEntry + ";" + kNewToken;
  EXPECT_EQ(FlushesOf(script), 1);
}

TEST_F(VelkDbFlush, StructureIsFlushed) {
  EXPECT_EQ(FlushesOf("CREATE TABLE other (a)"), 1);
  EXPECT_EQ(FlushesOf("CREATE INDEX other_a ON other (a)"), 1);
  EXPECT_EQ(FlushesOf("PRAGMA user_version = 9"), 1);
  EXPECT_EQ(FlushesOf("DROP TABLE other"), 1);
}

TEST_F(VelkDbFlush, VacuumIsFlushed) {
  EXPECT_GE(FlushesOf("VACUUM"), 1);
}

TEST_F(VelkDbFlush, WhatATriggerWritesCounts) {
  Run("CREATE TRIGGER counting AFTER UPDATE ON session"
      " BEGIN UPDATE entry SET use_count = use_count + 1; END");
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='1' WHERE id=1"), 1);
}

TEST_F(VelkDbFlush, ATriggerOfAnotherConnectionCounts) {
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='1' WHERE id=1"), 0);
  RawDatabase(path_).Run(
      "CREATE TRIGGER counting AFTER UPDATE ON session"
      " BEGIN UPDATE entry SET use_count = use_count + 1; END");
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='2' WHERE id=1"), 1);
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='3' WHERE id=1"), 1);
}

TEST_F(VelkDbFlush, ATriggerThatIsGoneCountsNoMore) {
  Run("CREATE TRIGGER counting AFTER UPDATE ON session"
      " BEGIN UPDATE entry SET use_count = use_count + 1; END");
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='1' WHERE id=1"), 1);
  RawDatabase(path_).Run("DROP TRIGGER counting");
  Run("UPDATE session SET timeout='2' WHERE id=1");
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='3' WHERE id=1"), 0);
}

TEST_F(VelkDbFlush, AFileWithoutTheListIsAlwaysFlushed) {
  RawDatabase(path_).Run("DROP TABLE velkdb_relaxed");
  Connect();
  EXPECT_EQ(FlushesOf(kNewSession), 1);
  EXPECT_EQ(FlushesOf("UPDATE token SET timeout='4102444801' WHERE id=1"), 1);
}

TEST_F(VelkDbFlush, AListOfAnotherFormListsNothing) {
  RawDatabase(path_).Run("DROP TABLE velkdb_relaxed; CREATE TABLE velkdb_relaxed (other)");
  Connect();
  EXPECT_EQ(FlushesOf(kNewSession), 1);
}

TEST_F(VelkDbFlush, NamesInTheListAreComparedWithoutCase) {
  Run("UPDATE velkdb_relaxed SET name = 'SESSION' WHERE name = 'session'");
  EXPECT_EQ(FlushesOf(kNewSession), 0);
}

TEST_F(VelkDbFlush, AListChangedByThisConnectionHoldsAtOnce) {
  EXPECT_EQ(FlushesOf("DELETE FROM velkdb_relaxed WHERE name = 'session'"), 1);
  EXPECT_EQ(FlushesOf(kNewSession), 1);
  EXPECT_EQ(FlushesOf("INSERT INTO velkdb_relaxed VALUES ('entry')"), 1);
  EXPECT_EQ(FlushesOf(kNewEntry), 0);
  EXPECT_EQ(FlushesOf("DROP TABLE velkdb_relaxed"), 1);
  EXPECT_EQ(FlushesOf(kNewToken), 1);
}

TEST_F(VelkDbFlush, AChangedListHoldsForStatementsThatHaveRunBefore) {
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='1' WHERE id=1"), 0);
  Run("BEGIN; DELETE FROM velkdb_relaxed WHERE name = 'session'");
  Run("UPDATE session SET timeout='2' WHERE id=1");
  Run("COMMIT");
  EXPECT_EQ(FlushesOf("UPDATE session SET timeout='3' WHERE id=1"), 1);
}

TEST_F(VelkDbFlush, AListChangedAndRolledBackIsAsBefore) {
  Run("BEGIN; INSERT INTO velkdb_relaxed VALUES ('entry')");
  Run("ROLLBACK");
  EXPECT_EQ(FlushesOf(kNewEntry), 1);
  EXPECT_EQ(FlushesOf(kNewSession), 0);
}

TEST_F(VelkDbFlush, ATemporaryTableOfARelaxedNameIsNotRelaxed) {
  Run("CREATE TEMP TABLE token (a)");
  EXPECT_EQ(FlushesOf("BEGIN; INSERT INTO temp.token VALUES (1);" + std::string(kNewSession) +
                      "; COMMIT"),
            1);
}

TEST_F(VelkDbFlush, AFailedFlushFailsTheStatement) {
  disk_is_broken = true;
  EXPECT_EQ(connection_->Run(kNewEntry), -1);
  disk_is_broken = false;
  EXPECT_EQ(connection_->Error(), "disk I/O error");
  EXPECT_EQ(connection_->Run("UPDATE entry SET enabled = '0'"), 0);
}

TEST_F(VelkDbFlush, AFailedFlushFailsTheCommit) {
  Run(std::string("BEGIN; ") + kNewEntry);
  disk_is_broken = true;
  EXPECT_EQ(connection_->Run("COMMIT"), -1);
  disk_is_broken = false;
  EXPECT_EQ(sqlite3_get_autocommit(VELKDBSqlite(connection_->handle())), 1);
}

TEST_F(VelkDbFlush, SettingsCannotTurnItOff) {
  Run("PRAGMA wal_autocheckpoint = 500");
  EXPECT_EQ(FlushesOf(kNewEntry), 1);
  Run("BEGIN; PRAGMA wal_autocheckpoint = 500");
  EXPECT_EQ(FlushesOf("UPDATE entry SET enabled = '0'; COMMIT"), 1);
  Run("PRAGMA synchronous = OFF");
  EXPECT_EQ(connection_->Value("PRAGMA synchronous", "synchronous"), "1");
}

TEST_F(VelkDbFlush, TheLogIsTakenIntoTheFileAtAThousandFrames) {
  for (int i = 0; i < 3000; ++i)
    Run("INSERT INTO session VALUES (NULL,'" + std::to_string(i) + "','1','::1','0')");
  const size_t frame = 4096 + 24;
  EXPECT_LT(std::filesystem::file_size(path_ + "-wal"), 1100 * frame);
  EXPECT_GT(std::filesystem::file_size(path_), 100 * 1024U);
}

// The reader is always one commit behind, so that each attempt would find something to take in.
TEST_F(VelkDbFlush, ALogThatAReaderHoldsIsNotTakenInAtEachCommit) {
  VelkDbConnection reader(path_);
  log_flushes = 0;
  for (int i = 0; i < 2500; ++i) {
    ASSERT_EQ(reader.Run("BEGIN; SELECT * FROM entry"), 0);
    Run("UPDATE token SET timeout='" + std::to_string(i) + "'");
    ASSERT_EQ(reader.Run("COMMIT"), 0);
  }
  EXPECT_GE(log_flushes, 1);
  EXPECT_LE(log_flushes, 10);
}

TEST_F(VelkDbFlush, ALogThatAReaderHeldIsTakenInLater) {
  VelkDbConnection reader(path_);
  ASSERT_EQ(reader.Run("BEGIN; SELECT * FROM entry"), 0);
  for (int i = 0; i < 1500; ++i) Run("UPDATE token SET timeout='" + std::to_string(i) + "'");
  ASSERT_EQ(reader.Run("COMMIT"), 0);
  for (int i = 0; i < 1500; ++i) Run("UPDATE token SET timeout='" + std::to_string(i) + "'");
  const auto size = std::filesystem::file_size(path_ + "-wal");
  for (int i = 0; i < 3000; ++i) Run("UPDATE token SET timeout='" + std::to_string(i) + "'");
  EXPECT_EQ(std::filesystem::file_size(path_ + "-wal"), size);
}

TEST_F(VelkDbFlush, WithoutALogSqliteFlushesByItself) {
  Run("PRAGMA journal_mode = DELETE");
  EXPECT_EQ(FlushesOf(kNewEntry), 0);
  EXPECT_EQ(connection_->Value("SELECT COUNT(*) AS c FROM entry", "c"), "2");
}

}  // namespace
