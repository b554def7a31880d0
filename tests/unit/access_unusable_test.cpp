#include <gtest/gtest.h>
#include <velksharing/access.h>

#include <cstdlib>
#include <filesystem>
#include <string>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/process.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using ::testing::Contains;
using velk_test::ErrorLine;
using velk_test::LogCapture;

/// A front end whose database cannot be opened. As for SharingDb, each has a process of its own.
class AccessWithoutDatabase : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    velk_test::RemoveSharingDatabase();
    std::filesystem::create_directories(velk_test::SharingDatabasePath());
  }

  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) velk_test::RemoveSharingDatabase();
  }

  static void InProcess(const std::function<void()> &body) {
    const int status = velk_test::RunForked([&body] {
      setenv("REMOTE_ADDR", "192.0.2.1", 1);
      body();
      return HasFailure() ? 1 : 0;
    });
    EXPECT_EQ(0, status) << "the front end's process failed";
  }
};

TEST_F(AccessWithoutDatabase, RefusesEveryLogin) {
  InProcess([] {
    const LogCapture quiet;
    const _tag_sharing_login_params params = {"hash", nullptr, nullptr, nullptr, nullptr};
    std::string session_id = "before";
    EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, VELK::VelkSharingLogin(session_id, &params, false));
    EXPECT_EQ("before", session_id);
    char buffer[33] = "";
    EXPECT_EQ(VELK_SHARING_LOGIN_UNUSABLE, ::VelkSharingLogin(buffer, sizeof buffer, &params, 0));
    EXPECT_STREQ("", buffer);
  });
}

TEST_F(AccessWithoutDatabase, AuthorizesNobodyAndLogsIt) {
  InProcess([] {
    const LogCapture log;
    const _tag_sharing_login_params params = {"hash", nullptr, nullptr, nullptr, "session"};
    EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, ::VelkSharingIsAuthorized(&params));
    EXPECT_THAT(log.lines(),
                Contains(ErrorLine("%s:%d db is not good", "sharinglogin:# db is not good")));
  });
}

TEST_F(AccessWithoutDatabase, NoticesTheDatabaseBeforeTheParameters) {
  InProcess([] {
    const LogCapture log;
    EXPECT_EQ(VELK_SHARING_AUTH_UNUSABLE, ::VelkSharingIsAuthorized(nullptr));
    EXPECT_THAT(log.lines(),
                Contains(ErrorLine("%s:%d db is not good", "sharinglogin:# db is not good")));
  });
}

TEST_F(AccessWithoutDatabase, LogsNobodyOutAndCountsNothing) {
  InProcess([] {
    const LogCapture log;
    EXPECT_EQ(0, ::VelkSharingLogout("hash", "session"));
    EXPECT_EQ(0, ::VelkSharingIncreaseUseCount("hash"));
    for (const std::string &text : log.Texts()) EXPECT_NE(0u, text.find("sharinglogin")) << text;
  });
}

}  // namespace
