#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <chrono>

#include "site/use_lock.h"
#include "support/log_capture.h"
#include "support/process.h"
#include "support/temp_dir.h"

namespace {

using std::chrono::milliseconds;
using velk_test::LogCapture;
using velk_test::RunForked;
using velk_test::TempDir;
using web::UseLock;

constexpr milliseconds kShort(30);

bool IsFree(const TempDir &folder, int link) {
  return UseLock(folder.path(), link, kShort).IsHeld();
}

TEST(UseLock, KeepsOtherProcessesAway) {
  const TempDir folder;
  const UseLock lock(folder.path(), 7, kShort);
  ASSERT_TRUE(lock.IsHeld());
  EXPECT_EQ(0, RunForked([&] { return IsFree(folder, 7) ? 1 : 0; }));
}

TEST(UseLock, IsOneForEachLink) {
  const TempDir folder;
  const UseLock lock(folder.path(), 7, kShort);
  EXPECT_TRUE(IsFree(folder, 6));
  EXPECT_TRUE(IsFree(folder, 8));
  EXPECT_TRUE(IsFree(folder, 2147483647));
}

TEST(UseLock, EndsWithItsScope) {
  const TempDir folder;
  EXPECT_TRUE(IsFree(folder, 7));
  EXPECT_TRUE(IsFree(folder, 7));
}

TEST(UseLock, EndsWithItsProcess) {
  const TempDir folder;
  const int ended = RunForked([&]() -> int {
    const UseLock lock(folder.path(), 7, kShort);
    kill(getpid(), SIGKILL);
    return 0;
  });
  ASSERT_EQ(128 + SIGKILL, ended);
  EXPECT_TRUE(IsFree(folder, 7));
}

TEST(UseLock, GivesUpAfterAWhile) {
  const TempDir folder;
  const UseLock lock(folder.path(), 7, kShort);
  const LogCapture log;
  const UseLock second(folder.path(), 7, kShort);
  EXPECT_FALSE(second.IsHeld());
  EXPECT_EQ(1u, log.lines().size());
}

TEST(UseLock, IsNotHeldWithoutAFolder) {
  const LogCapture log;
  EXPECT_FALSE(UseLock(TempDir().File("none"), 7, kShort).IsHeld());
  EXPECT_EQ(1u, log.lines().size());
}

}  // namespace
