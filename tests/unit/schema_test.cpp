#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <filesystem>
#include <string>
#include <vector>

#include "support/build_folders.h"
#include "support/process.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velkdb_connection.h"

namespace {

using testing::AllOf;
using testing::Each;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using velk_test::RawDatabase;
using velk_test::ReadFile;
using velk_test::RunForked;
using velk_test::RunForkedTogether;
using velk_test::TempDir;
using velk_test::VelkDbConnection;
using velk_test::WriteFile;

std::string Script(int version) {
  return ReadFile(std::string(VELK_SOURCE_DIR) + "/schema/" + std::to_string(version) + ".sql");
}

std::string OldDatabase(int version) {
  return std::string(VELK_SOURCE_DIR) + "/tests/data/sharing-v" + std::to_string(version) + ".db";
}

// Runs the scripts that the file's version asks for. False when one fails.
bool Migrate(const std::string &path) {
  VelkDbConnection database(path);
  for (int version = std::stoi(database.Value("PRAGMA user_version", "user_version")) + 1;
       version <= 2; ++version) {
    if (database.Run(Script(version)) != 0) return false;
  }
  return true;
}

// All that a schema version consists of.
std::vector<std::vector<std::string>> Describe(const std::string &path) {
  RawDatabase database(path);
  auto description =
      database.Rows("SELECT type, name, tbl_name, sql FROM sqlite_schema ORDER BY type, name");
  description.push_back(database.Rows("PRAGMA user_version")[0]);
  description.push_back(database.Rows("PRAGMA journal_mode")[0]);
  if (database.Value("SELECT COUNT(*) FROM sqlite_schema WHERE name = 'velkdb_relaxed'") == "1")
    for (const auto &row : database.Rows("SELECT name FROM velkdb_relaxed ORDER BY name"))
      description.push_back(row);
  return description;
}

// An empty file, as the library makes one.
class Schema : public testing::Test {
 protected:
  Schema() { WriteFile(path_, ""); }

  // A new database of the newest version.
  std::string Fresh() {
    const std::string path = folder_.File("fresh.db");
    if (!std::filesystem::exists(path)) velk_test::MakeSharingDatabase(path);
    return path;
  }

  // How SQLite runs a statement: one line per step.
  std::string Plan(const std::string &sql) {
    RawDatabase database(Fresh());
    std::string plan;
    for (const auto &row : database.Rows("EXPLAIN QUERY PLAN " + sql)) plan += row[3] + "\n";
    return plan;
  }

  std::vector<std::string> Columns(const std::string &table) {
    RawDatabase database(Fresh());
    std::vector<std::string> columns;
    for (const auto &row : database.Rows("PRAGMA table_info(" + table + ")"))
      columns.push_back(row[1] + " " + row[2]);
    return columns;
  }

  TempDir folder_;
  std::string path_ = folder_.File("sharing.db");
};

// ---- Tables

TEST_F(Schema, EntryHasTheLinksColumnsInTheirOrder) {
  EXPECT_THAT(
      Columns("entry"),
      ElementsAre("id INTEGER", "hash TEXT", "project_name TEXT", "enabled INTEGER",
                  "owner_uid INTEGER", "start_at INTEGER", "expire_at INTEGER",
                  "expire_times INTEGER", "use_count INTEGER", "auto_gc INTEGER", "data TEXT"));
}

TEST_F(Schema, SessionHasTheSessionsColumnsInTheirOrder) {
  EXPECT_THAT(Columns("session"), ElementsAre("id INTEGER", "session_id TEXT", "uid INTEGER",
                                              "ip TEXT", "timeout INTEGER"));
}

TEST_F(Schema, TokenHasTheGrantsColumnsInTheirOrder) {
  EXPECT_THAT(Columns("token"), ElementsAre("id INTEGER", "entry_id INTEGER", "session_id INTEGER",
                                            "timeout INTEGER"));
}

constexpr char kEntryTail[] = ",'photo','1','4294967295','0','0','0','0','0','{}')";

TEST_F(Schema, QuotedNumbersAreStoredAsNumbers) {
  RawDatabase database(Fresh());
  database.Run(std::string("INSERT INTO entry VALUES (NULL,'123'") + kEntryTail);
  EXPECT_EQ(
      database.Value("SELECT typeof(hash) || typeof(enabled) || typeof(owner_uid) FROM entry"),
      "textintegerinteger");
  EXPECT_EQ(database.Value("SELECT owner_uid FROM entry"), "4294967295");
}

TEST_F(Schema, AHashIsUnique) {
  RawDatabase database(Fresh());
  const std::string insert = std::string("INSERT INTO entry VALUES (NULL,'same'") + kEntryTail;
  database.Run(insert);
  EXPECT_THROW(database.Run(insert), std::runtime_error);
}

TEST_F(Schema, HashesThatDifferInCaseAreDifferent) {
  RawDatabase database(Fresh());
  database.Run(std::string("INSERT INTO entry VALUES (NULL,'same'") + kEntryTail);
  database.Run(std::string("INSERT INTO entry VALUES (NULL,'SAME'") + kEntryTail);
  EXPECT_EQ(database.Value("SELECT COUNT(*) FROM entry"), "2");
}

TEST_F(Schema, ASessionIdIsUnique) {
  RawDatabase database(Fresh());
  const std::string insert = "INSERT INTO session VALUES (NULL,'same','1','::1','0')";
  database.Run(insert);
  EXPECT_THROW(database.Run(insert), std::runtime_error);
}

TEST_F(Schema, IdsAreNeverReused) {
  RawDatabase database(Fresh());
  for (const std::string table : {"entry", "session", "token"}) {
    const std::string columns = table == "entry"     ? "NULL,'a',0,0,0,0,0,0,0,0,0"
                                : table == "session" ? "NULL,'a',0,0,0"
                                                     : "NULL,0,0,0";
    database.Run("INSERT INTO " + table + " VALUES (" + columns + "); DELETE FROM " + table);
    database.Run("INSERT INTO " + table + " VALUES (" + columns + ")");
    EXPECT_EQ(database.Value("SELECT id FROM " + table), "2") << table;
  }
}

TEST_F(Schema, AGrantNeedsNeitherItsLinkNorItsSession) {
  RawDatabase database(Fresh());
  database.Run("PRAGMA foreign_keys = ON; INSERT INTO token VALUES (NULL,'7','8','0')");
  EXPECT_EQ(database.Value("SELECT COUNT(*) FROM token"), "1");
}

// ---- Indexes

TEST_F(Schema, LookupsUseAnIndex) {
  EXPECT_THAT(Plan("SELECT * FROM entry WHERE hash = 'a'"), HasSubstr("(hash=?)"));
  EXPECT_THAT(Plan("SELECT * FROM session WHERE session_id = 'a'"), HasSubstr("(session_id=?)"));
  EXPECT_THAT(Plan("SELECT * FROM token WHERE session_id = 12 AND entry_id = 7"),
              HasSubstr("(session_id=? AND entry_id=?)"));
  EXPECT_THAT(Plan("SELECT * FROM token WHERE id = 7"), HasSubstr("INTEGER PRIMARY KEY"));
}

TEST_F(Schema, WhatOneOwnerSharesIsFoundThroughAnIndex) {
  EXPECT_THAT(Plan("DELETE FROM entry WHERE owner_uid = 1026"), HasSubstr("(owner_uid=?)"));
  EXPECT_THAT(Plan("SELECT * FROM entry WHERE `owner_uid` = '1026' AND `project_name` = 'photo'"),
              HasSubstr("(owner_uid=? AND project_name=?)"));
}

TEST_F(Schema, GrantsOfALinkAreFoundThroughAnIndex) {
  EXPECT_THAT(Plan("DELETE FROM token WHERE entry_id = 7"), HasSubstr("(entry_id=?)"));
}

TEST_F(Schema, PurgesOfLapsedSessionsAndGrantsUseAnIndex) {
  EXPECT_THAT(Plan("DELETE FROM session WHERE timeout < '1700000000'"), HasSubstr("(timeout<?)"));
  EXPECT_THAT(Plan("DELETE FROM token WHERE timeout < '1700000000'"), HasSubstr("(timeout<?)"));
}

TEST_F(Schema, ThePurgeOfExpiredLinksReadsNoOtherLinks) {
  EXPECT_THAT(Plan("DELETE FROM entry WHERE auto_gc = 1 AND "
                   " ((expire_at != 0 AND expire_at < 1700000000) OR"
                   " (expire_times != 0 AND use_count >= expire_times))"),
              AllOf(HasSubstr("entry_by_expiry (auto_gc=? AND expire_at<?)"),
                    HasSubstr("entry_used_up (auto_gc=?)"), Not(HasSubstr("SCAN"))));
}

TEST_F(Schema, ThePurgeOfOneProjectReadsNoOtherProjects) {
  EXPECT_THAT(Plan("DELETE FROM entry WHERE owner_uid = 1026 AND project_name = 'photo' AND "
                   "((expire_at != 0 AND expire_at < 1700000000) OR"
                   " (expire_times != 0 AND use_count >= expire_times))"),
              HasSubstr("(owner_uid=? AND project_name=?)"));
}

// ---- Running the scripts

TEST_F(Schema, TheScriptsMakeVersionsOneAndTwo) {
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run(Script(1)), 0) << database.Error();
  EXPECT_EQ(database.Value("PRAGMA user_version", "user_version"), "1");
  ASSERT_EQ(database.Run(Script(2)), 0) << database.Error();
  EXPECT_EQ(database.Value("PRAGMA user_version", "user_version"), "2");
  EXPECT_EQ(database.Value("PRAGMA journal_mode", "journal_mode"), "wal");
}

TEST_F(Schema, TheScriptsMayRunTwice) {
  VelkDbConnection database(path_);
  for (const int version : {1, 1, 2, 2, 1, 2})
    ASSERT_EQ(database.Run(Script(version)), 0) << version << ": " << database.Error();
  EXPECT_EQ(Describe(path_), Describe(Fresh()));
}

TEST_F(Schema, TheScriptsLeaveRowsAlone) {
  ASSERT_TRUE(Migrate(path_));
  VelkDbConnection database(path_);
  ASSERT_EQ(database.Run(std::string("INSERT INTO entry VALUES (NULL,'a'") + kEntryTail), 0);
  ASSERT_EQ(database.Run(Script(1) + Script(2)), 0);
  EXPECT_EQ(database.Value("SELECT COUNT(*) AS c FROM entry", "c"), "1");
}

// Every point at which a statement has just ended, or a comment is broken off.
std::vector<size_t> BreakPoints(const std::string &script) {
  std::vector<size_t> points{0};
  for (size_t at = script.find(';'); at != std::string::npos; at = script.find(';', at + 1))
    points.push_back(at + 1);
  return points;
}

TEST_F(Schema, AScriptKilledAnywhereIsRepairedByTheNextStart) {
  for (const int version : {1, 2}) {
    for (const size_t point : BreakPoints(Script(version))) {
      std::filesystem::remove(path_ + "-wal");
      std::filesystem::remove(path_ + "-shm");
      WriteFile(path_, "");
      const int status = RunForked([&] {
        VelkDbConnection database(path_);
        if (version == 2 && database.Run(Script(1)) != 0) return 1;
        database.Run(Script(version).substr(0, point));
        return raise(SIGKILL);
      });
      ASSERT_EQ(status, 128 + SIGKILL);
      ASSERT_TRUE(Migrate(path_)) << version << " cut at " << point;
      EXPECT_EQ(Describe(path_), Describe(Fresh())) << version << " cut at " << point;
    }
  }
}

TEST_F(Schema, ProcessesThatStartTogetherOnAnEmptyFileAllSucceed) {
  const std::vector<int> statuses =
      RunForkedTogether(32, [this](int) { return Migrate(path_) ? 0 : 1; });
  EXPECT_THAT(statuses, Each(0));
  EXPECT_EQ(Describe(path_), Describe(Fresh()));
}

// ---- Databases of released versions

TEST_F(Schema, ADatabaseOfVersionOneMigratedEqualsAFreshOne) {
  std::filesystem::copy_file(OldDatabase(1), path_,
                             std::filesystem::copy_options::overwrite_existing);
  ASSERT_EQ(RawDatabase(path_).Value("PRAGMA user_version"), "1");
  ASSERT_TRUE(Migrate(path_));
  EXPECT_EQ(Describe(path_), Describe(Fresh()));
}

TEST_F(Schema, ADatabaseOfVersionTwoEqualsAFreshOne) {
  std::filesystem::copy_file(OldDatabase(2), path_,
                             std::filesystem::copy_options::overwrite_existing);
  EXPECT_EQ(Describe(path_), Describe(Fresh()));
}

TEST_F(Schema, WhatChangesNothingOfASessionOrGrantIsNotWritten) {
  const std::string log = Fresh() + "-wal";
  VelkDbConnection database(Fresh());
  ASSERT_EQ(database.Run("INSERT INTO session VALUES (NULL,'abc','4294967295','192.0.2.1','100')"),
            0);
  ASSERT_EQ(database.Run("INSERT INTO token VALUES (NULL,'1','1','100')"), 0);
  const auto size = std::filesystem::file_size(log);
  EXPECT_EQ(database.Run("UPDATE session SET ip='192.0.2.1',session_id='abc',timeout='100',"
                         "uid='4294967295' WHERE id=1"),
            0);
  EXPECT_EQ(database.Run("UPDATE token SET entry_id='1',session_id='1',timeout='100' WHERE id=1"),
            0);
  EXPECT_EQ(std::filesystem::file_size(log), size);
}

TEST_F(Schema, WhateverChangesOfASessionOrGrantIsWritten) {
  VelkDbConnection database(Fresh());
  ASSERT_EQ(database.Run("INSERT INTO session VALUES (NULL,'abc','1000',NULL,'100')"), 0);
  ASSERT_EQ(database.Run("INSERT INTO token VALUES (NULL,'1','1','100')"), 0);
  for (const char *column : {"session_id='abd'", "uid='1001'", "ip='192.0.2.1'", "timeout='101'"}) {
    ASSERT_EQ(database.Run(std::string("UPDATE session SET ") + column + " WHERE id=1"), 0);
    EXPECT_EQ(database.Value(std::string("SELECT COUNT(*) AS n FROM session WHERE ") + column, "n"),
              "1");
  }
  for (const char *column : {"session_id='2'", "entry_id='2'", "timeout='101'"}) {
    ASSERT_EQ(database.Run(std::string("UPDATE token SET ") + column + " WHERE id=1"), 0);
    EXPECT_EQ(database.Value(std::string("SELECT COUNT(*) AS n FROM token WHERE ") + column, "n"),
              "1");
  }
}

TEST_F(Schema, MigrationKeepsTheRowsOfVersionOne) {
  std::filesystem::copy_file(OldDatabase(1), path_,
                             std::filesystem::copy_options::overwrite_existing);
  ASSERT_TRUE(Migrate(path_));
  RawDatabase migrated(path_);
  std::filesystem::copy_file(OldDatabase(2), folder_.File("v2.db"));
  RawDatabase second(folder_.File("v2.db"));
  for (const std::string table : {"entry", "session", "token", "sqlite_sequence"}) {
    const auto rows = migrated.Rows("SELECT * FROM " + table + " ORDER BY 1");
    EXPECT_GE(rows.size(), 2U) << table;
    EXPECT_EQ(rows, second.Rows("SELECT * FROM " + table + " ORDER BY 1")) << table;
  }
  EXPECT_EQ(migrated.Value("PRAGMA integrity_check"), "ok");
}

TEST_F(Schema, MigrationGoesOnCountingIdsWhereVersionOneStopped) {
  std::filesystem::copy_file(OldDatabase(1), path_,
                             std::filesystem::copy_options::overwrite_existing);
  ASSERT_TRUE(Migrate(path_));
  RawDatabase database(path_);
  database.Run(std::string("INSERT INTO entry VALUES (NULL,'next'") + kEntryTail);
  EXPECT_EQ(database.Value("SELECT id FROM entry WHERE hash = 'next'"), "4");
}

}  // namespace
