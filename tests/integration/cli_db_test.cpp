// Looking after the database from the command line.

#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <filesystem>
#include <thread>

#include "integration/cli_support.h"
#include "support/build_folders.h"

namespace {

namespace fs = std::filesystem;

using testing::HasSubstr;
using testing::IsEmpty;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::ReadFile;
using velk_test::SharingDatabasePath;
using velk_test::TempDir;
using velk_test::WriteFile;

class CliDb : public velk_test::CommandLine {
 protected:
  static std::vector<std::string> FilesIn(const TempDir &folder) {
    std::vector<std::string> names;
    for (const auto &file : fs::directory_iterator(folder.path()))
      names.push_back(file.path().filename());
    return names;
  }
};

TEST_F(CliDb, StatusCountsByState) {
  const std::string hash = MakeLink();
  MakeLink({"--expire", "@1000"});
  LogIn(hash);
  const Json::Value status = RunJson({"db", "status"});
  EXPECT_EQ(SharingDatabasePath(), status["path"].asString());
  EXPECT_EQ(2, status["version"].asInt());
  EXPECT_EQ("wal", status["journal_mode"].asString());
  EXPECT_EQ(static_cast<Json::Int64>(fs::file_size(SharingDatabasePath())),
            status["database_bytes"].asInt64());
  EXPECT_EQ(2, status["links"]["total"].asInt());
  EXPECT_EQ(1, status["links"]["active"].asInt());
  EXPECT_EQ(1, status["links"]["expired"].asInt());
  EXPECT_EQ(1, status["sessions"]["live"].asInt());
  EXPECT_EQ(1, status["tokens"]["live"].asInt());
}

TEST_F(CliDb, StatusMakesNoDatabase) {
  EXPECT_EQ(3, Run({"db", "status"}).status);
  EXPECT_FALSE(fs::exists(SharingDatabasePath()));
}

TEST_F(CliDb, CheckOfASoundDatabase) {
  MakeLink();
  const Outcome outcome = Run({"db", "check"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("the file is sound"));
}

TEST_F(CliDb, CheckNamesRowsThatCannotBeLoaded) {
  MakeLink();
  const std::string damaged = MakeLink();
  Damage(damaged);
  const Outcome outcome = Run({"db", "check"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("link 2, hash " + damaged));
  EXPECT_THAT(outcome.out, HasSubstr("2 links, 1 of them cannot be loaded"));
}

TEST_F(CliDb, CheckSurvivesEveryKindOfHostileRow) {
  MakeLink();
  RawDatabase raw(SharingDatabasePath());
  const auto insert = [&](const std::string &hash, const std::string &data) {
    raw.Run("INSERT INTO entry SELECT NULL, '" + hash +
            "', project_name, enabled, owner_uid, "
            "start_at, expire_at, expire_times, use_count, auto_gc, " +
            data + " FROM entry WHERE id = 1");
  };
  insert("array", "'[]'");
  insert("types", R"('{"protect_uids":"x","app":{},"enable_match_ip":{}}')");
  insert("deep", "'{\"app\":{\"a\":" + std::string(100000, '[') + std::string(100000, ']') + "}}'");
  insert("blob", "x'00ff00'");
  insert("empty", "''");
  const Outcome outcome = Run({"db", "check"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("6 links, 5 of them cannot be loaded"));
  EXPECT_EQ(0, Run({"link", "list"}).status);
}

TEST_F(CliDb, CheckFindsADamagedFile) {
  MakeLink();
  {
    RawDatabase raw(SharingDatabasePath());
    raw.Run("PRAGMA writable_schema = ON");
    raw.Run(
        "UPDATE sqlite_master SET rootpage = (SELECT rootpage FROM sqlite_master WHERE name = "
        "'session') WHERE name = 'token'");
  }
  const Outcome outcome = Run({"db", "check"});
  EXPECT_EQ(3, outcome.status) << outcome.err;
  EXPECT_THAT(outcome.out, HasSubstr("damage: 2nd reference to page"));
  EXPECT_THAT(outcome.out, HasSubstr("the file is damaged\n"));
}

TEST_F(CliDb, VacuumGivesRoomBack) {
  MakeLink();
  RawDatabase(SharingDatabasePath())
      .Run("CREATE TABLE big (x); INSERT INTO big VALUES (zeroblob(4000000)); DROP TABLE big");
  const Json::Value sizes = RunJson({"db", "vacuum"});
  EXPECT_GT(sizes["before"].asInt64(), 4000000);
  EXPECT_LT(sizes["after"].asInt64(), 200000);
  EXPECT_EQ(1, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliDb, BackupIsAPrivateCopyInTheSameForm) {
  const TempDir folder;
  const std::string hash = MakeLink();
  const std::string copy = folder.File("copy.db");
  EXPECT_EQ(0, Run({"db", "backup", copy}).status);
  struct stat info = {};
  ASSERT_EQ(0, stat(copy.c_str(), &info));
  EXPECT_EQ(0600u, info.st_mode & 07777);
  EXPECT_THAT(FilesIn(folder), testing::ElementsAre("copy.db"));
  EXPECT_EQ("\x02\x02", ReadFile(copy).substr(18, 2)) << "the journal stays a log";
  RawDatabase raw(copy);
  EXPECT_EQ("2", raw.Value("PRAGMA user_version"));
  EXPECT_EQ(hash, raw.Value("SELECT hash FROM entry"));
  EXPECT_EQ("ok", raw.Value("PRAGMA integrity_check"));
}

TEST_F(CliDb, BackupRefusesAnExistingFile) {
  const TempDir folder;
  MakeLink();
  WriteFile(folder.File("copy.db"), "precious");
  const Outcome outcome = Run({"db", "backup", folder.File("copy.db")});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("exists"));
  EXPECT_EQ("precious", ReadFile(folder.File("copy.db")));
  EXPECT_EQ(1u, FilesIn(folder).size());
}

TEST_F(CliDb, BackupFollowsNoSymbolicLink) {
  const TempDir folder;
  MakeLink();
  fs::create_symlink(folder.File("elsewhere"), folder.File("copy.db"));
  EXPECT_EQ(1, Run({"db", "backup", folder.File("copy.db")}).status);
  EXPECT_FALSE(fs::exists(folder.File("elsewhere")));
}

TEST_F(CliDb, BackupIntoAFolderThatDoesNotExistFails) {
  MakeLink();
  EXPECT_EQ(3, Run({"db", "backup", "/no/such/folder/copy.db"}).status);
}

TEST_F(CliDb, AFailedBackupLeavesNothingBehind) {
  const TempDir folder;
  MakeLink();
  // No file of that process may grow past 16 KiB.
  const Outcome outcome = velk_test::RunProgram({"/bin/bash", "-c",
                                                 "trap '' XFSZ; ulimit -f 16; exec " VELK_BINARY_DIR
                                                 "/bin/velksharing db backup " +
                                                     folder.File("copy.db")});
  EXPECT_EQ(3, outcome.status) << outcome.err;
  EXPECT_THAT(FilesIn(folder), IsEmpty());
}

TEST_F(CliDb, AChangeThatTheDiskHasNoRoomForIsReportedWithItsReason) {
  MakeLink();
  // No file of that process may grow past 64 KiB.
  const Outcome outcome =
      velk_test::RunProgram({"/bin/bash", "-c",
                             "trap '' XFSZ; ulimit -f 64; exec " VELK_BINARY_DIR
                             "/bin/velksharing link create --project files --title \"$0\"",
                             std::string(100000, 't')});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("could not be stored: "));
  EXPECT_THAT(outcome.err, testing::AnyOf(HasSubstr("full"), HasSubstr("I/O")));
  EXPECT_EQ(1, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliDb, BackupIsConsistentWhileOthersWrite) {
  const TempDir folder;
  MakeLink();
  RawDatabase(SharingDatabasePath()).Run("CREATE TABLE pair (a, b)");
  std::atomic<bool> stop = false;
  std::thread writer([&] {
    RawDatabase raw(SharingDatabasePath());
    raw.Run("PRAGMA busy_timeout = 10000");
    while (!stop) {
      raw.Run(
          "BEGIN IMMEDIATE; INSERT INTO pair VALUES (1, randomblob(5000)); "
          "INSERT INTO pair VALUES (2, randomblob(5000)); COMMIT");
    }
  });
  for (int i = 0; i < 5; ++i) {
    const std::string copy = folder.File("copy" + std::to_string(i));
    EXPECT_EQ(0, Run({"db", "backup", copy}).status);
    RawDatabase raw(copy);
    EXPECT_EQ("ok", raw.Value("PRAGMA integrity_check"));
    EXPECT_EQ("0", raw.Value("SELECT COUNT(*) % 2 FROM pair"));
  }
  stop = true;
  writer.join();
}

}  // namespace
