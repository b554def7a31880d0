#include <gtest/gtest.h>
#include <velksharing/database.h>

#include <cstring>
#include <filesystem>

#include "fault/platform_override.h"
#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "velk_paths.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::db::BaseDB;
using VELK::sharing::db::Condition;
using VELK::sharing::db::Result;
using VELK::sharing::db::SharingDB;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
namespace real = velk_test::real;

class BaseDbFault : public ::testing::Test {
 protected:
  /// From now on, notes the platform's calls that a connection makes.
  void WatchCalls() {
    Overrides().file_exist = [this](const char *path) {
      calls_.push_back("exist " + Name(path));
      return real::FileExist(path);
    };
    Overrides().file_touch = [this](const char *path) {
      calls_.push_back("touch " + Name(path));
      return real::FileTouch(path);
    };
    Overrides().acl_chmod = [this](const char *path, int reserved, unsigned int mode) {
      calls_.push_back("chmod " + Name(path) + " " + std::to_string(reserved) + " " +
                       std::to_string(mode));
      return real::AclChmod(path, reserved, mode);
    };
    Overrides().db_connect = [this](const char *host, const char *user, const char *password,
                                    const char *path) {
      calls_.push_back("connect '" + std::string(host) + "' '" + user + "' '" + password + "' " +
                       Name(path));
      return real::DbConnect(host, user, password, path);
    };
    Overrides().db_execute = [this](VELKDBHandle *handle, const char *sql, DBResult **result) {
      calls_.push_back(sql);
      return real::DbExecute(handle, sql, result);
    };
    Overrides().db_close = [this](VELKDBHandle *handle) {
      calls_.push_back("close");
      real::DbClose(handle);
    };
  }

  /// Lets one statement fail.
  static void FailStatement(const std::string &wanted) {
    const auto before = Overrides().db_execute;
    Overrides().db_execute = [wanted, before](VELKDBHandle *handle, const char *sql,
                                              DBResult **result) {
      const int outcome =
          before ? before(handle, sql, result) : real::DbExecute(handle, sql, result);
      return sql == wanted ? -1 : outcome;
    };
  }

  std::string Name(const char *path) const {
    return path == path_ ? "base.db" : "another path: " + std::string(path);
  }

  /// Makes a connection that fails and tells what it logged.
  void ExpectBroken(const std::string &format, const std::string &text) {
    const LogCapture log;
    const BaseDB db(path_, 0660);
    EXPECT_FALSE(db.IsGood());
    EXPECT_THAT(log.lines(),
                ElementsAre(ErrorLine("%s:%d (%u) " + format, "base_db:# (@) " + text)));
  }

  const OverrideScope scope_;
  velk_test::TempDir folder_;
  const std::string path_ = folder_.File("base.db");
  std::vector<std::string> calls_;
};

TEST_F(BaseDbFault, MakesAndOpensAMissingFileStepByStep) {
  WatchCalls();
  { EXPECT_TRUE(BaseDB(path_, 0660).IsGood()); }
  EXPECT_THAT(calls_, ElementsAre("exist base.db", "touch base.db", "chmod base.db -1 432",
                                  "connect '' '' '' base.db", "PRAGMA cache_size = 5000",
                                  "PRAGMA foreign_keys = ON", "close"));
}

TEST_F(BaseDbFault, OpensAnExistingFileAsItIs) {
  velk_test::WriteFile(path_, "");
  WatchCalls();
  EXPECT_TRUE(BaseDB(path_, 0660).IsGood());
  EXPECT_THAT(calls_, ElementsAre("exist base.db", "connect '' '' '' base.db",
                                  "PRAGMA cache_size = 5000", "PRAGMA foreign_keys = ON", "close"));
}

TEST_F(BaseDbFault, StopsWhenTheFileCannotBeMade) {
  WatchCalls();
  Overrides().file_touch = [](const char *) { return -1; };
  ExpectBroken("create database failed on %s\n\n", "create database failed on " + path_ + "\n\n");
  EXPECT_THAT(calls_, ElementsAre("exist base.db"));
}

TEST_F(BaseDbFault, StopsWhenTheModeCannotBeSet) {
  WatchCalls();
  Overrides().acl_chmod = [](const char *, int, unsigned int) { return -1; };
  ExpectBroken("change mode failed on %s\n\n", "change mode failed on " + path_ + "\n\n");
  EXPECT_THAT(calls_, ElementsAre("exist base.db", "touch base.db"));
}

TEST_F(BaseDbFault, StopsWhenThereIsNoConnection) {
  WatchCalls();
  Overrides().db_connect = [](const char *, const char *, const char *, const char *) {
    return static_cast<VELKDBHandle *>(nullptr);
  };
  ExpectBroken("db connect failed\n\n", "db connect failed\n\n");
  EXPECT_THAT(calls_, ElementsAre("exist base.db", "touch base.db", "chmod base.db -1 432"))
      << "nothing to run a statement on, and nothing to close";
}

TEST_F(BaseDbFault, StopsWhenTheFirstPragmaFails) {
  velk_test::WriteFile(path_, "");
  WatchCalls();
  FailStatement("PRAGMA cache_size = 5000");
  ExpectBroken("init failed\n\n", "init failed\n\n");
  EXPECT_THAT(calls_, ElementsAre("exist base.db", "connect '' '' '' base.db",
                                  "PRAGMA cache_size = 5000", "close"));
}

TEST_F(BaseDbFault, StopsWhenTheSecondPragmaFails) {
  FailStatement("PRAGMA foreign_keys = ON");
  ExpectBroken("init failed\n\n", "init failed\n\n");
}

TEST_F(BaseDbFault, IsNeverGoodAgainAfterAFailedPragma) {
  FailStatement("PRAGMA foreign_keys = ON");
  const LogCapture quiet;
  BaseDB db(path_, 0660);
  Overrides() = {};
  EXPECT_FALSE(db.Execute("SELECT 1"));
  int id = 77;
  EXPECT_FALSE(db.GetLastInsertId(id));
  EXPECT_EQ(77, id);
  EXPECT_EQ("PRAGMA foreign_keys = ON", db.GetLastQuery());
}

TEST_F(BaseDbFault, RollsAFailedCommitBackOnce) {
  BaseDB db(path_, 0660);
  ASSERT_TRUE(db.Begin());
  WatchCalls();
  Overrides().db_execute = [this](VELKDBHandle *handle, const char *sql, DBResult **result) {
    calls_.push_back(sql);
    return strcmp(sql, "COMMIT") == 0 ? -1 : real::DbExecute(handle, sql, result);
  };
  EXPECT_FALSE(db.Commit());
  EXPECT_THAT(calls_, ElementsAre("COMMIT", "ROLLBACK"));
}

TEST_F(BaseDbFault, RollsBackOnceEvenWhenThatFails) {
  BaseDB db(path_, 0660);
  Overrides().db_execute = [this](VELKDBHandle *, const char *sql, DBResult **) {
    calls_.push_back(sql);
    return -1;
  };
  EXPECT_FALSE(db.Commit());
  EXPECT_THAT(calls_, ElementsAre("COMMIT", "ROLLBACK"));
}

TEST_F(BaseDbFault, TakesOnlyMinusOneAsAFailedStatement) {
  BaseDB db(path_, 0660);
  Overrides().db_execute = [](VELKDBHandle *, const char *, DBResult **) { return 1; };
  EXPECT_TRUE(db.Execute("SELECT 1"));
}

TEST_F(BaseDbFault, EscapesWithTwiceTheLengthAsRoom) {
  const BaseDB db(path_, 0660);
  Overrides().db_escape = [](int engine, char *out, size_t capacity, const char *in,
                             size_t length) {
    EXPECT_EQ(0, engine);
    EXPECT_EQ(10u, capacity);
    EXPECT_EQ(std::string("a'b\0c", 5), std::string(in, length));
    return real::DbEscape(engine, out, capacity, in, length);
  };
  EXPECT_EQ("a''b", db.Escape(std::string("a'b\0c", 5)));
}

TEST_F(BaseDbFault, LogsAFailedEscapeAndGivesNothing) {
  const BaseDB db(path_, 0660);
  Overrides().db_escape = [](int, char *, size_t, const char *, size_t) { return -1; };
  const LogCapture log;
  EXPECT_EQ("", db.Escape("text"));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d (%u) escape failed\n\n",
                                                 "base_db:# (@) escape failed\n\n")));
}

TEST_F(BaseDbFault, RendersAnEmptyTextWhereEscapingFails) {
  BaseDB db(path_, 0660);
  Condition condition(db);
  condition.Where("a", "1").Where("b = 2").OrderBy("c", true);
  Overrides().db_escape = [](int, char *, size_t, const char *, size_t) { return -1; };
  const LogCapture quiet;
  EXPECT_EQ(" WHERE `` = '' AND b = 2 ORDER BY  DESC", condition.GetSQL());
}

TEST_F(BaseDbFault, EscapesATextOfAnyLengthThatThePlatformFillsToItsEnd) {
  const BaseDB db(path_, 0660);
  for (const size_t length : {1u, 2u, 127u, 128u, 4096u, 1u << 20})
    EXPECT_EQ(std::string(2 * length, '\''), db.Escape(std::string(length, '\'')));
}

/// The sharing database over a file of its own; the platform redirects its path.
class SharingDbFault : public ::testing::Test {
 protected:
  void SetUp() override {
    Overrides().file_exist = [](const char *) { return 1; };
    Overrides().db_connect = [this](const char *host, const char *user, const char *password,
                                    const char *) {
      return real::DbConnect(host, user, password, path_.c_str());
    };
    velk_test::MakeSharingDatabase(path_);
  }

  const OverrideScope scope_;
  velk_test::TempDir folder_;
  const std::string path_ = folder_.File("sharing.db");
};

TEST_F(SharingDbFault, NeedsToKnowTheVersion) {
  Overrides().db_execute = [](VELKDBHandle *handle, const char *sql, DBResult **result) {
    const int outcome = real::DbExecute(handle, sql, result);
    return strcmp(sql, "PRAGMA user_version") == 0 ? -1 : outcome;
  };
  const LogCapture log;
  EXPECT_FALSE(SharingDB().IsGood());
  EXPECT_THAT(log.lines(), ElementsAre(velk_test::FailedCondition(
                               "sharing_db", "!pdb_->Execute(\"PRAGMA user_version\", result)")));
}

TEST_F(SharingDbFault, NeedsARowWithTheVersion) {
  Overrides().db_execute = [](VELKDBHandle *handle, const char *sql, DBResult **result) {
    const bool version = strcmp(sql, "PRAGMA user_version") == 0;
    return real::DbExecute(handle, version ? "SELECT 1 WHERE 0" : sql, result);
  };
  const LogCapture log;
  EXPECT_FALSE(SharingDB().IsGood());
  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) user_version is not correct\n\n",
                                    "sharing_db:# (@) user_version is not correct\n\n")));
}

TEST_F(SharingDbFault, IsOpenedUnderItsFixedPathAndMode) {
  std::vector<std::string> calls;
  Overrides().file_exist = [](const char *) { return 0; };
  Overrides().file_touch = [](const char *) { return 0; };
  Overrides().acl_chmod = [&calls](const char *path, int, unsigned int mode) {
    calls.push_back(std::string(path) + " " + std::to_string(mode));
    return 0;
  };
  EXPECT_TRUE(SharingDB().IsGood());
  EXPECT_THAT(calls, ElementsAre(VELK_ROOT "/etc/private/session/sharing.db 432"));
}

}  // namespace
