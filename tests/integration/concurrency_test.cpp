// Front ends are processes that meet in the database file: many at once, none of them fails.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <velksharing/access.h>
#include <velksharing/database.h>

#include <cstdlib>
#include <filesystem>
#include <string>

#include "support/process.h"
#include "support/raw_database.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using testing::AllOf;
using testing::Each;
using testing::SizeIs;
using VELK::sharing::db::SharingDB;
using velk_test::RawDatabase;
using velk_test::RunForkedTogether;
using velk_test::SharingDatabasePath;

/// No library call in the test's own process: a first call belongs behind the fork.
class Concurrency : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    Clear();
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) Clear();
  }

  static void MakeDatabaseWithALink() {
    velk_test::MakeSharingDatabase(SharingDatabasePath());
    RawDatabase(SharingDatabasePath())
        .Run(
            "INSERT INTO entry VALUES (NULL, 'link', 'photo', 1, 1026, 0, 0, 0, 0, 0, "
            R"('{"app":{},"protect_type":"none"}'))");
  }

  static bool ComeFromOwnAddress(int number) {
    return setenv("REMOTE_ADDR", ("192.0.2." + std::to_string(number + 1)).c_str(), 1) == 0;
  }

  static bool LogIn() {
    const _tag_sharing_login_params params = {"link", nullptr, nullptr, nullptr, nullptr};
    std::string session_id;
    return VELK::VelkSharingLogin(session_id, &params, false) == VELK_SHARING_LOGIN_OK;
  }

  static std::string Value(const std::string &sql) {
    return RawDatabase(SharingDatabasePath()).Value(sql);
  }

 private:
  static void Clear() {
    velk_test::RemoveSharingDatabase();
    velk_test::RemoveAutoBlockDatabase();
  }
};

TEST_F(Concurrency, NoLoginOfManyProcessesFails) {
  constexpr int kProcesses = 16;
  constexpr int kLogins = 500;
  MakeDatabaseWithALink();

  const std::vector<int> exits = RunForkedTogether(kProcesses, [](int number) {
    if (!ComeFromOwnAddress(number)) return 2;
    for (int login = 0; login < kLogins; ++login) {
      if (!LogIn()) return 1;
    }
    return 0;
  });

  EXPECT_THAT(exits, AllOf(SizeIs(kProcesses), Each(0)));
  EXPECT_EQ(Value("SELECT COUNT(*) FROM session"), std::to_string(kProcesses * kLogins));
  EXPECT_EQ(Value("SELECT COUNT(*) FROM token"), std::to_string(kProcesses * kLogins));
  EXPECT_EQ(Value("SELECT COUNT(DISTINCT ip) FROM session"), std::to_string(kProcesses));
  EXPECT_EQ(Value("PRAGMA integrity_check"), "ok");
}

TEST_F(Concurrency, FirstCallsOfManyProcessesMakeOneDatabase) {
  constexpr int kProcesses = 32;

  const std::vector<int> exits = RunForkedTogether(kProcesses, [](int) {
    return SharingDB::Instance().IsGood() && SharingDB::Instance().Insert("token", {"1", "1", "9"})
               ? 0
               : 1;
  });

  EXPECT_THAT(exits, AllOf(SizeIs(kProcesses), Each(0)));
  EXPECT_EQ(Value("PRAGMA user_version"), "2");
  EXPECT_EQ(Value("SELECT COUNT(*) FROM token"), std::to_string(kProcesses));
  EXPECT_EQ(Value("PRAGMA integrity_check"), "ok");
}

}  // namespace
