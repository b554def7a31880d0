#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>

#include <filesystem>
#include <thread>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/process.h"
#include "support/raw_database.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::db::SharingDB;
using velk_test::ErrorLine;
using velk_test::FailedCondition;
using velk_test::InstalledScript;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::RunForked;
using velk_test::SharingDatabasePath;

/// The instance lives as long as its process, so every scenario has a process of its own; this one
/// never makes an instance.
class SharingDb : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    std::filesystem::create_directories(std::filesystem::path(SharingDatabasePath()).parent_path());
    velk_test::RemoveSharingDatabase();
    velk_test::InstallScripts();
  }

  void TearDown() override {
    if (!velk_test::OwnsVelkRoot()) return;
    velk_test::RemoveSharingDatabase();
    velk_test::InstallScripts();
  }

  static void InProcess(const std::function<void()> &body) {
    const int status = RunForked([&body] {
      body();
      return HasFailure() ? 1 : 0;
    });
    EXPECT_EQ(0, status) << "the scenario's process failed";
  }

  static void ExpectGoodInstance() {
    InProcess([] {
      const LogCapture log;
      EXPECT_TRUE(SharingDB::Instance().IsGood());
      EXPECT_THAT(log.Texts(), IsEmpty());
    });
  }

  static std::string Value(const std::string &sql) {
    return RawDatabase(SharingDatabasePath()).Value(sql);
  }

  static void SetVersion(int version) {
    RawDatabase(SharingDatabasePath()).Run("PRAGMA user_version = " + std::to_string(version));
  }

  static ::testing::Matcher<const velk_test::LogLine &> CannotMigrate(int from, int to) {
    return ErrorLine("%s:%d (%u) cannot migrate from %d to %d\n\n",
                     "sharing_db:# (@) cannot migrate from " + std::to_string(from) + " to " +
                         std::to_string(to) + "\n\n");
  }

  static ::testing::Matcher<const velk_test::LogLine &> CannotOpen(const std::string &name) {
    return ErrorLine("%s:%d (%u) file %s open failed %m.\n\n",
                     "sharing_db:# (@) file " + InstalledScript(name) +
                         " open failed No such file or directory.\n\n");
  }
};

TEST_F(SharingDb, MakesAMissingDatabaseOfTheNewestVersion) {
  ExpectGoodInstance();
  EXPECT_EQ("2", Value("PRAGMA user_version"));
  for (const char *table : {"entry", "session", "token"})
    EXPECT_EQ("0", Value(std::string("SELECT COUNT(*) FROM ") + table)) << table;
}

TEST_F(SharingDb, GivesANewFileMode0660AndTheSystemAccount) {
  const mode_t before = umask(0077);
  ExpectGoodInstance();
  umask(before);
  struct stat status = {};
  ASSERT_EQ(0, stat(SharingDatabasePath().c_str(), &status));
  EXPECT_EQ(0660u, status.st_mode & 07777);
  EXPECT_EQ(static_cast<uid_t>(VELK_SYSTEM_UID), status.st_uid);
}

TEST_F(SharingDb, RunsTheScriptsInOrder) {
  velk_test::WriteFile(InstalledScript("1.sql"),
                       "CREATE TABLE step (name); INSERT INTO step VALUES ('one');"
                       "PRAGMA user_version = 1");
  velk_test::WriteFile(InstalledScript("2.sql"),
                       "INSERT INTO step VALUES ('two'); PRAGMA user_version = 2");
  ExpectGoodInstance();
  EXPECT_EQ("one,two", Value("SELECT group_concat(name) FROM step"));
  EXPECT_EQ("2", Value("PRAGMA user_version"));
}

TEST_F(SharingDb, IsOneInstance) {
  InProcess([] { EXPECT_EQ(&SharingDB::Instance(), &SharingDB::Instance()); });
}

TEST_F(SharingDb, IsMadeOnceBySeveralThreads) {
  InProcess([] {
    std::vector<const SharingDB *> instances(8);
    std::vector<std::thread> threads;
    for (const SharingDB *&instance : instances)
      threads.emplace_back([&instance] { instance = &SharingDB::Instance(); });
    for (std::thread &thread : threads) thread.join();
    EXPECT_THAT(instances, ::testing::Each(&SharingDB::Instance()));
    EXPECT_TRUE(SharingDB::Instance().IsGood());
  });
}

TEST_F(SharingDb, IsMadeByManyProcessesAtOnce) {
  std::vector<pid_t> children;
  for (int number = 0; number < 32; ++number) {
    const pid_t child = fork();
    ASSERT_NE(-1, child);
    if (child == 0) _exit(SharingDB::Instance().IsGood() ? 0 : 1);
    children.push_back(child);
  }
  for (const pid_t child : children) {
    int status = -1;
    EXPECT_EQ(child, waitpid(child, &status, 0));
    EXPECT_EQ(0, status);
  }
  EXPECT_EQ("2", Value("PRAGMA user_version"));
}

TEST_F(SharingDb, MayBeMadeWithoutTheInstance) {
  const SharingDB database;
  EXPECT_TRUE(database.IsGood());
}

TEST_F(SharingDb, KeepsWhatADatabaseHolds) {
  velk_test::MakeSharingDatabase(SharingDatabasePath());
  RawDatabase(SharingDatabasePath())
      .Run("INSERT INTO token (entry_id, session_id, timeout) VALUES (1, 2, 3)");
  ExpectGoodInstance();
  EXPECT_EQ("1", Value("SELECT COUNT(*) FROM token"));
}

TEST_F(SharingDb, ReadsNoScriptForADatabaseThatIsNewEnough) {
  for (const int version : {2, 3, 2147483647}) {
    SetVersion(version);
    std::filesystem::remove_all(VELK_ROOT "/share/velksharing/db_schema");
    ExpectGoodInstance();
    EXPECT_EQ(std::to_string(version), Value("PRAGMA user_version"));
  }
}

TEST_F(SharingDb, RunsOnlyTheSecondScriptForVersionOne) {
  SetVersion(1);
  std::filesystem::remove(InstalledScript("1.sql"));
  velk_test::WriteFile(InstalledScript("2.sql"), "PRAGMA user_version = 2");
  ExpectGoodInstance();
  EXPECT_EQ("2", Value("PRAGMA user_version"));
}

TEST_F(SharingDb, LogsAMissingScript) {
  SetVersion(1);
  std::filesystem::remove(InstalledScript("2.sql"));
  InProcess([] {
    const LogCapture log;
    EXPECT_FALSE(SharingDB::Instance().IsGood());
    EXPECT_THAT(log.lines(), ElementsAre(CannotOpen("2.sql"), CannotMigrate(1, 2)));
  });
  EXPECT_EQ("1", Value("PRAGMA user_version"));
}

TEST_F(SharingDb, StopsAtTheFirstStepThatFails) {
  std::filesystem::remove(InstalledScript("1.sql"));
  InProcess([] {
    const LogCapture log;
    EXPECT_FALSE(SharingDB::Instance().IsGood());
    EXPECT_THAT(log.lines(), ElementsAre(CannotOpen("1.sql"), CannotMigrate(0, 1)));
  });
}

TEST_F(SharingDb, CannotMigrateANegativeVersion) {
  SetVersion(-1);
  InProcess([] {
    const LogCapture log;
    EXPECT_FALSE(SharingDB::Instance().IsGood());
    EXPECT_THAT(log.lines(), ElementsAre(CannotOpen("0.sql"), CannotMigrate(-1, 0)));
  });
  SetVersion(-2147483647 - 1);
  InProcess([] {
    const LogCapture log;
    EXPECT_FALSE(SharingDB::Instance().IsGood());
    EXPECT_THAT(log.lines(), ElementsAre(CannotOpen("-2147483647.sql"),
                                         CannotMigrate(-2147483647 - 1, -2147483647)));
  });
}

TEST_F(SharingDb, LogsAScriptThatFailsAndKeepsTheStepsBefore) {
  velk_test::WriteFile(InstalledScript("2.sql"), "CREATE TABLE kept (a); nonsense");
  InProcess([] {
    const LogCapture log;
    EXPECT_FALSE(SharingDB::Instance().IsGood());
    EXPECT_THAT(log.lines(),
                ElementsAre(FailedCondition("sharing_db", "!pdb_->Execute(sstr.str().c_str())"),
                            CannotMigrate(1, 2)));
  });
  EXPECT_EQ("1", Value("PRAGMA user_version"));
  EXPECT_EQ("0", Value("SELECT COUNT(*) FROM entry"));
}

TEST_F(SharingDb, RunsAScriptAgainThatSetsNoVersion) {
  velk_test::WriteFile(InstalledScript("1.sql"),
                       "CREATE TABLE IF NOT EXISTS run (a); INSERT INTO run VALUES (1)");
  velk_test::WriteFile(InstalledScript("2.sql"), "");
  ExpectGoodInstance();
  EXPECT_EQ("0", Value("PRAGMA user_version"));
  ExpectGoodInstance();
  EXPECT_EQ("2", Value("SELECT COUNT(*) FROM run"));
}

TEST_F(SharingDb, RunsALargeScript) {
  velk_test::WriteFile(InstalledScript("2.sql"),
                       "-- " + std::string(10u << 20, 'x') + "\nPRAGMA user_version = 2");
  ExpectGoodInstance();
  EXPECT_EQ("2", Value("PRAGMA user_version"));
}

TEST_F(SharingDb, IsNotGoodWithoutItsFile) {
  std::filesystem::create_directory(SharingDatabasePath());
  InProcess([] {
    const LogCapture log;
    const SharingDB &database = SharingDB::Instance();
    EXPECT_FALSE(database.IsGood());
    EXPECT_THAT(
        log.lines(),
        ElementsAre(
            ErrorLine("%s:%d (%u) db connect failed\n\n", "base_db:# (@) db connect failed\n\n"),
            ErrorLine("%s:%d (%u) db is not good.\n\n", "base_db:# (@) db is not good.\n\n"),
            FailedCondition("sharing_db", "!pdb_->Execute(\"PRAGMA user_version\", result)")));
  });
}

TEST_F(SharingDb, StaysNotGoodUntilTheProcessEnds) {
  std::filesystem::remove(InstalledScript("1.sql"));
  InProcess([] {
    const LogCapture log;
    const SharingDB &first = SharingDB::Instance();
    EXPECT_FALSE(first.IsGood());
    velk_test::InstallScripts();
    EXPECT_EQ(&first, &SharingDB::Instance());
    EXPECT_FALSE(SharingDB::Instance().IsGood());
  });
  ExpectGoodInstance();
}

}  // namespace
