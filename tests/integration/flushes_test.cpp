// What a visit waits for the disk, as the system sees it.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "support/process.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using velk_test::Outcome;
using velk_test::RunProgram;

constexpr char kLink[] =
    "INSERT INTO entry VALUES (NULL, 'link', 'photo', 1, 1026, 0, 0, 0, 0, 0, "
    R"('{"app":{},"protect_type":"none"}'))";

/// A visit of another process, traced.
class Flushes : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    if (RunProgram({"strace", "-f", "true"}).status != 0)
      GTEST_SKIP() << "processes cannot be traced here";
    Clear();
    velk_test::InstallScripts();
    velk_test::MakeSharingDatabase(velk_test::SharingDatabasePath());
    velk_test::RawDatabase(velk_test::SharingDatabasePath()).Run(kLink);
    Trace();
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) Clear();
  }

  /// The flushes between the marks.
  long Between(const std::string &begin, const std::string &end) const {
    const auto from = Find(begin);
    const auto to = Find(end);
    EXPECT_TRUE(from < to && to != trace_.end()) << "no marks in the trace";
    return std::count_if(from, to, [](const std::string &line) {
      return line.find("fsync(") != std::string::npos ||
             line.find("fdatasync(") != std::string::npos;
    });
  }

 private:
  static void Clear() {
    velk_test::RemoveSharingDatabase();
    velk_test::RemoveAutoBlockDatabase();
  }

  void Trace() {
    const velk_test::TempDir folder;
    const Outcome visit =
        RunProgram({"strace", "-f", "-e", "trace=fsync,fdatasync,sync_file_range,close", "-o",
                    folder.File("trace"), FLUSHES_PROGRAM, "link"},
                   "", {"REMOTE_ADDR=192.0.2.1"});
    ASSERT_EQ(visit.status, 0) << visit.err;
    std::istringstream lines(velk_test::ReadFile(folder.File("trace")));
    for (std::string line; std::getline(lines, line);) trace_.push_back(line);
  }

  std::vector<std::string>::const_iterator Find(const std::string &text) const {
    return std::find_if(trace_.begin(), trace_.end(), [&text](const std::string &line) {
      return line.find(text) != std::string::npos;
    });
  }

  std::vector<std::string> trace_;
};

TEST_F(Flushes, ALoginWaitsForTheDiskOnceForItsUseOfTheLink) {
  EXPECT_EQ(Between("close(1001)", "close(1002)"), 1);
}

TEST_F(Flushes, AnAuthorizedCheckDoesNotWaitForTheDisk) {
  EXPECT_EQ(Between("close(1002)", "close(1003)"), 0);
}

}  // namespace
