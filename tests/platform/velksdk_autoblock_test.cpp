// Counting and blocking of failing addresses, over the real file in VELK_ROOT.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <climits>
#include <filesystem>
#include <numeric>
#include <regex>
#include <string>
#include <thread>
#include <vector>

#include "support/build_folders.h"
#include "support/log_capture.h"
#include "support/process.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velk_root.h"
#include "velk/velkcgi.h"
#include "velk/velksdk.h"
#include "velk_paths.h"

namespace fs = std::filesystem;

namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;
using testing::StartsWith;
using velk_test::LogCapture;
using velk_test::RawDatabase;
using velk_test::ReadFile;
using velk_test::RunForked;
using velk_test::RunForkedTogether;
using velk_test::WriteFile;

const std::string kFolder = VELK_ROOT "/etc/private";
const std::string kFile = kFolder + "/autoblock.db";
const std::string kConfig = VELK_ROOT "/etc/autoblock.conf";
constexpr char kAddress[] = "192.0.2.7";

class AutoBlock : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    fs::create_directories(kFolder);
    Clean();
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) Clean();
  }

  static std::vector<std::string> Files() {
    std::vector<std::string> names;
    for (const auto &entry : fs::directory_iterator(kFolder)) {
      const std::string name = entry.path().filename();
      if (name.starts_with("autoblock.db")) names.push_back(name);
    }
    return names;
  }

  static void Clean() {
    for (const std::string &name : Files()) fs::remove_all(kFolder + "/" + name);
    fs::remove_all(kConfig);
  }

  static void Fail(int times, const char *address = kAddress) {
    for (int i = 0; i < times; ++i) ASSERT_EQ(0, AutoBlockFailLoginSet(address, "SHARING"));
  }

  /// Lets time pass for all that is remembered.
  static void Age(int seconds) {
    const std::string by = std::to_string(seconds);
    RawDatabase(kFile).Run("UPDATE autoblock SET first_failure = first_failure - " + by +
                           ", last_failure = last_failure - " + by +
                           ", blocked_until = CASE WHEN blocked_until > 0 THEN blocked_until - " +
                           by + " ELSE blocked_until END");
  }

  static std::string Attempts(const std::string &address = kAddress) {
    return RawDatabase(kFile).Value("SELECT attempts FROM autoblock WHERE address = '" + address +
                                    "'");
  }

  static std::vector<std::string> Addresses() {
    std::vector<std::string> addresses;
    VELKAutoBlockList(
        [](const VELKAutoBlockRecord *record, void *data) {
          static_cast<std::vector<std::string> *>(data)->push_back(record->address);
          return 0;
        },
        &addresses);
    return addresses;
  }

  LogCapture log;
};

// ---- counting and blocking

TEST_F(AutoBlock, BlocksAtTheTenthFailure) {
  Fail(9);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  Fail(1);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, LogsOneLineWhenAnAddressBecomesBlocked) {
  Fail(15);
  ASSERT_THAT(log.lines(), SizeIs(1));
  EXPECT_EQ(LOG_AUTH | LOG_WARNING, log.lines()[0].priority);
  EXPECT_EQ("autoblock: blocked 192.0.2.7 for 86400 seconds, category SHARING",
            log.lines()[0].text);
}

TEST_F(AutoBlock, BlocksOneAddressAndNotItsNeighbour) {
  Fail(10);
  EXPECT_EQ(0, VELKAutoBlockIsDenied("192.0.2.8"));
}

TEST_F(AutoBlock, CountsTogetherWhatFallsIntoTheWindow) {
  Fail(9);
  Age(290);
  Fail(1);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, StartsAgainWhenTheWindowOfTheFirstFailureIsOver) {
  Fail(1);
  Age(200);
  Fail(8);
  Age(100);
  Fail(1);
  EXPECT_EQ("1", Attempts());
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, CountsAFailureThatIsStoredAfterAYoungerOne) {
  Fail(1);
  Age(-5);
  Fail(1);
  EXPECT_EQ("2", Attempts());
}

TEST_F(AutoBlock, StartsAgainAfterAFailureFromAFarFuture) {
  Fail(9);
  Age(-100000);
  Fail(1);
  EXPECT_EQ("1", Attempts());
}

TEST_F(AutoBlock, KeepsTheCountWhileBlocked) {
  Fail(12);
  EXPECT_EQ("10", Attempts());
}

TEST_F(AutoBlock, BlockLapsesAfterADay) {
  Fail(10);
  Age(86000);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  Age(400);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, StartsAgainAfterALapsedBlock) {
  Fail(10);
  Age(86400);
  Fail(9);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  Fail(1);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.lines(), SizeIs(2));
}

TEST_F(AutoBlock, StartsAgainWhenABlockLapsesWithinTheWindow) {
  WriteFile(kConfig, "within = 300\nblock = 10\n");
  Fail(10);
  Age(10);
  Fail(1);
  EXPECT_EQ("1", Attempts());
}

TEST_F(AutoBlock, ResetForgetsFailuresAndBlock) {
  Fail(10);
  EXPECT_EQ(0, VELKAutoBlockResetByIP(kAddress));
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(Addresses(), IsEmpty());
  EXPECT_EQ(0, VELKAutoBlockResetByIP(kAddress));
}

TEST_F(AutoBlock, ResetLeavesOtherAddressesAlone) {
  Fail(10);
  Fail(3, "192.0.2.8");
  EXPECT_EQ(0, VELKAutoBlockResetByIP("192.0.2.8"));
  EXPECT_THAT(Addresses(), ElementsAre(kAddress));
}

TEST_F(AutoBlock, AskingAndResettingNeverMakeTheFile) {
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  EXPECT_EQ(0, VELKAutoBlockResetByIP(kAddress));
  EXPECT_THAT(Addresses(), IsEmpty());
  EXPECT_THAT(Files(), IsEmpty());
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST_F(AutoBlock, AMissingFolderIsAnErrorOnlyForCounting) {
  const std::string aside = kFolder + ".aside";
  fs::rename(kFolder, aside);
  const int denied = VELKAutoBlockIsDenied(kAddress);
  const int counted = AutoBlockFailLoginSet(kAddress, "SHARING");
  fs::rename(aside, kFolder);
  EXPECT_EQ(0, denied);
  EXPECT_EQ(-1, counted);
  EXPECT_THAT(log.Texts(), ElementsAre(EndsWith("No such file or directory")));
}

TEST_F(AutoBlock, FileIsForOwnerAndGroupOnly) {
  const mode_t before = umask(0077);
  Fail(1);
  umask(before);
  struct stat status {};
  ASSERT_EQ(0, stat(kFile.c_str(), &status));
  EXPECT_EQ(0660U, status.st_mode & 07777);
  EXPECT_EQ(static_cast<uid_t>(VELK_SYSTEM_UID), status.st_uid);
  EXPECT_EQ(static_cast<gid_t>(VELK_SYSTEM_GID), status.st_gid);
  EXPECT_THAT(Files(), ElementsAre("autoblock.db"));
}

// ---- by hand, and the list

TEST_F(AutoBlock, BlocksByHandForATime) {
  EXPECT_EQ(0, VELKAutoBlockAdd(kAddress, "by-hand", 60));
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.Texts(),
              ElementsAre("autoblock: blocked 192.0.2.7 for 60 seconds, category by-hand"));
  Age(60);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, BlocksByHandForEver) {
  EXPECT_EQ(0, VELKAutoBlockAdd(kAddress, "by-hand", 0));
  Age(2000000000);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.Texts(), ElementsAre("autoblock: blocked 192.0.2.7 for ever, category by-hand"));
}

TEST_F(AutoBlock, BlockByHandReplacesABlock) {
  Fail(10);
  EXPECT_EQ(0, VELKAutoBlockAdd(kAddress, "by-hand", 5));
  Age(5);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, RefusesABlockOfImpossibleLength) {
  EXPECT_EQ(-1, VELKAutoBlockAdd(kAddress, "by-hand", -1));
  EXPECT_EQ(-1, VELKAutoBlockAdd(kAddress, "by-hand", LONG_MAX));
  EXPECT_THAT(Files(), IsEmpty());
}

TEST_F(AutoBlock, ListsBlockedOnesFirstThenTheNewest) {
  Fail(1, "192.0.2.1");
  Age(50);
  Fail(10, "192.0.2.2");
  Age(50);
  Fail(2, "192.0.2.3");
  EXPECT_THAT(Addresses(), ElementsAre("192.0.2.2", "192.0.2.3", "192.0.2.1"));
}

TEST_F(AutoBlock, ListTellsWhatIsRememberedOfAnAddress) {
  const long before = time(nullptr);
  Fail(10);
  struct Seen {
    std::string category;
    VELKAutoBlockRecord record;
  } seen{};
  EXPECT_EQ(0, VELKAutoBlockList(
                   [](const VELKAutoBlockRecord *record, void *data) {
                     *static_cast<Seen *>(data) = {record->category, *record};
                     return 0;
                   },
                   &seen));
  EXPECT_EQ("SHARING", seen.category);
  EXPECT_EQ(10, seen.record.attempts);
  EXPECT_EQ(1, seen.record.blocked);
  EXPECT_GE(seen.record.last_failure, before);
  EXPECT_EQ(seen.record.last_failure + 86400, seen.record.blocked_until);
}

TEST_F(AutoBlock, ListStopsWhenTheVisitorHasSeenEnough) {
  Fail(1, "192.0.2.1");
  Fail(1, "192.0.2.2");
  int visits = 0;
  EXPECT_EQ(0, VELKAutoBlockList(
                   [](const VELKAutoBlockRecord *, void *data) {
                     ++*static_cast<int *>(data);
                     return 1;
                   },
                   &visits));
  EXPECT_EQ(1, visits);
  EXPECT_EQ(-1, VELKAutoBlockList(nullptr, nullptr));
}

TEST_F(AutoBlock, ListedAddressesCanBeResetFromWithinTheList) {
  Fail(1, "192.0.2.1");
  Fail(1, "2001:db8::1");
  EXPECT_EQ(0, VELKAutoBlockList([](const VELKAutoBlockRecord *record,
                                    void *) { return VELKAutoBlockResetByIP(record->address); },
                                 nullptr));
  EXPECT_THAT(Addresses(), IsEmpty());
}

// ---- addresses and categories

TEST_F(AutoBlock, CountsIpv6ByItsNetworkOf64Bits) {
  Fail(5, "2001:db8:1:2::1");
  Fail(5, "2001:DB8:1:2:ffff:ffff:ffff:ffff");
  EXPECT_EQ(1, VELKAutoBlockIsDenied("2001:db8:1:2:3::"));
  EXPECT_EQ(0, VELKAutoBlockIsDenied("2001:db8:1:3::1"));
  EXPECT_THAT(Addresses(), ElementsAre("2001:db8:1:2::/64"));
  EXPECT_THAT(
      log.Texts(),
      ElementsAre("autoblock: blocked 2001:db8:1:2::/64 for 86400 seconds, category SHARING"));
}

TEST_F(AutoBlock, FoldsIpv4WrittenAsIpv6) {
  Fail(5, "::ffff:192.0.2.7");
  Fail(5, "::FFFF:C000:0207");
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(Addresses(), ElementsAre(kAddress));
}

TEST_F(AutoBlock, DropsZoneIds) {
  Fail(1, "fe80::1%eth0");
  Fail(1, "fe80::1%\n<script>");
  EXPECT_EQ("2", Attempts("fe80::/64"));
}

TEST_F(AutoBlock, RefusesWhatIsNoAddress) {
  const std::string huge(1 << 20, '1');
  for (const char *garbage : {static_cast<const char *>(nullptr),
                              "",
                              " ",
                              "192.0.2",
                              "192.0.2.256",
                              "192.0.2.7 ",
                              " 192.0.2.7",
                              "192.0.2.7:80",
                              "192.0.2.7%eth0",
                              "192.0.2.0/64",
                              "[2001:db8::1]",
                              "2001:db8::/48",
                              "2001:db8::1::2",
                              "/64",
                              "%",
                              "localhost",
                              "'; DROP TABLE autoblock; --",
                              "192.0.2.7\n",
                              "\xff\xfe",
                              huge.c_str()}) {
    SCOPED_TRACE(garbage == nullptr ? "null" : std::string(garbage).substr(0, 40));
    EXPECT_EQ(-1, AutoBlockFailLoginSet(garbage, "SHARING"));
    EXPECT_EQ(-1, VELKAutoBlockIsDenied(garbage));
    EXPECT_EQ(-1, VELKAutoBlockResetByIP(garbage));
    EXPECT_EQ(-1, VELKAutoBlockAdd(garbage, "SHARING", 60));
    EXPECT_EQ(0, VelkCgiIsDeniedIP(garbage));
  }
  EXPECT_THAT(Files(), IsEmpty());
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST_F(AutoBlock, NeverLogsACategoryThatIsUnfitForALogLine) {
  const std::string long_one(65, 'x');
  for (const char *category : {static_cast<const char *>(nullptr), "", "two words", "line\nbreak",
                               "%s%n", "umlaut-\xc3\xa4", long_one.c_str()}) {
    log.Clear();
    EXPECT_EQ(0, VELKAutoBlockAdd(kAddress, category, 0));
    EXPECT_THAT(log.Texts(), ElementsAre(EndsWith(", category unknown")));
  }
  log.Clear();
  EXPECT_EQ(0, VELKAutoBlockAdd(kAddress, "Web-Share_2.0", 0));
  EXPECT_THAT(log.Texts(), ElementsAre(EndsWith(", category Web-Share_2.0")));
}

TEST_F(AutoBlock, Fail2banFilterFindsEveryBlockLine) {
  const std::string filter =
      ReadFile(VELK_SOURCE_DIR "/packaging/fail2ban/velksharing-filter.conf");
  std::smatch found;
  ASSERT_TRUE(
      std::regex_search(filter, found, std::regex("failregex = \\^%\\(__prefix_line\\)s(.*)")));
  const std::string subnet = "([0-9a-f:.]+(?:/[0-9]+)?)";
  const std::regex line(std::regex_replace(found[1].str(), std::regex("<SUBNET>"), subnet));

  VELKAutoBlockAdd("192.0.2.7", "SHARING", 0);
  VELKAutoBlockAdd("2001:db8::1", "not fit", 60);
  Fail(10, "192.0.2.9");
  ASSERT_THAT(log.lines(), SizeIs(3));
  std::vector<std::string> addresses;
  for (const std::string &text : log.Texts()) {
    ASSERT_TRUE(std::regex_match(text, found, line)) << text;
    addresses.push_back(found[1]);
  }
  EXPECT_THAT(addresses, ElementsAre("192.0.2.7", "2001:db8::/64", "192.0.2.9"));
}

// ---- many processes

TEST_F(AutoBlock, CountsEveryFailureOfManyProcesses) {
  WriteFile(kConfig, "attempts = 1000000\n");
  const auto outcomes = RunForkedTogether(16, [](int) {
    int lost = 0;
    for (int i = 0; i < 100; ++i) lost += AutoBlockFailLoginSet(kAddress, "SHARING") == 0 ? 0 : 1;
    return lost;
  });
  EXPECT_THAT(outcomes, testing::Each(0));
  EXPECT_EQ("1600", Attempts());
  EXPECT_THAT(Files(), testing::Each(testing::Not(HasSubstr("autoblock.db."))));
}

TEST_F(AutoBlock, LogsOneBlockLineOfManyProcesses) {
  const auto lines = RunForkedTogether(16, [this](int) {
    for (int i = 0; i < 20; ++i) AutoBlockFailLoginSet(kAddress, "SHARING");
    return static_cast<int>(log.lines().size());
  });
  EXPECT_EQ(1, std::accumulate(lines.begin(), lines.end(), 0));
  EXPECT_EQ("10", Attempts());
}

TEST_F(AutoBlock, CountsEveryFailureOfManyThreads) {
  WriteFile(kConfig, "attempts = 1000000\n");
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) threads.emplace_back([] { Fail(50); });
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ("200", Attempts());
}

TEST_F(AutoBlock, WorksOnBothSidesOfAFork) {
  Fail(1);
  EXPECT_EQ(0, RunForked([] { return AutoBlockFailLoginSet(kAddress, "SHARING"); }));
  Fail(1);
  EXPECT_EQ("3", Attempts());
}

// ---- the limit of remembered addresses

constexpr int kMostRows = 100000;

/// Fills the table up to its limit with the networks 10.x.x.x, the lower the older.
void FillUp(const std::string &blocked_until) {
  RawDatabase(kFile).Run(
      "DELETE FROM autoblock; WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i + 1 FROM n"
      " WHERE i + 1 < " +
      std::to_string(kMostRows) +
      ") INSERT INTO autoblock SELECT '10.' || (i >> 16) || '.' || ((i >> 8) & 255) || '.' ||"
      " (i & 255), 'x', 1, unixepoch() - 200000 + i, unixepoch() - 200000 + i, " +
      blocked_until + " FROM n");
}

std::string RowCount() {
  return RawDatabase(kFile).Value("SELECT count(*) FROM autoblock");
}

bool Remembers(const std::string &address) {
  return !RawDatabase(kFile)
              .Value("SELECT 1 FROM autoblock WHERE address = '" + address + "'")
              .empty();
}

TEST_F(AutoBlock, ForgetsTheOldestUnblockedAddressFirst) {
  Fail(1);
  FillUp("CASE WHEN i < 2 THEN 0 WHEN i = 3 THEN unixepoch() - 1 END");
  Fail(1, "192.0.2.1");
  EXPECT_EQ("100000", RowCount());
  EXPECT_TRUE(Remembers("10.0.0.0"));
  EXPECT_TRUE(Remembers("10.0.0.1"));
  EXPECT_FALSE(Remembers("10.0.0.2"));
  Fail(1, "192.0.2.2");
  EXPECT_FALSE(Remembers("10.0.0.3")) << "its block has lapsed";
  EXPECT_TRUE(Remembers("10.0.0.4"));
  EXPECT_TRUE(Remembers("192.0.2.1"));
  EXPECT_TRUE(Remembers("192.0.2.2"));
}

TEST_F(AutoBlock, ForgetsTheOldestBlockWhenAllAreBlocked) {
  Fail(1);
  FillUp("unixepoch() + 1000");
  Fail(1, "192.0.2.1");
  EXPECT_EQ("100000", RowCount());
  EXPECT_FALSE(Remembers("10.0.0.0"));
  EXPECT_TRUE(Remembers("10.0.0.1"));
  EXPECT_TRUE(Remembers("192.0.2.1"));
}

TEST_F(AutoBlock, AHandMadeBlockMakesRoomToo) {
  Fail(1);
  FillUp("NULL");
  EXPECT_EQ(0, VELKAutoBlockAdd("192.0.2.1", "by-hand", 0));
  EXPECT_EQ("100000", RowCount());
  EXPECT_FALSE(Remembers("10.0.0.0"));
}

TEST_F(AutoBlock, AnotherFailureOfAKnownAddressForgetsNobody) {
  Fail(1);
  FillUp("NULL");
  Fail(1, "10.0.0.9");
  EXPECT_EQ("100000", RowCount());
  EXPECT_TRUE(Remembers("10.0.0.0"));
}

// ---- a file that cannot be used

TEST_F(AutoBlock, ACorruptFileLetsVisitorsInAndIsLogged) {
  WriteFile(kFile, std::string(8192, 'x'));
  EXPECT_EQ(-1, VELKAutoBlockIsDenied(kAddress));
  ASSERT_THAT(log.lines(), SizeIs(1));
  EXPECT_EQ(LOG_ERR, log.lines()[0].priority);
  EXPECT_EQ("autoblock: cannot use " + kFile + ": file is not a database", log.lines()[0].text);
  EXPECT_EQ(0, VelkCgiIsDeniedIP(kAddress));
  EXPECT_EQ(-1, AutoBlockFailLoginSet(kAddress, "SHARING"));
  EXPECT_EQ(-1, VELKAutoBlockResetByIP(kAddress));
  EXPECT_EQ(-1, VELKAutoBlockAdd(kAddress, "SHARING", 0));
  EXPECT_EQ(-1, VELKAutoBlockList([](const VELKAutoBlockRecord *, void *) { return 0; }, nullptr));
  EXPECT_THAT(log.lines(), SizeIs(6));
  EXPECT_EQ(std::string(8192, 'x'), ReadFile(kFile));
}

TEST_F(AutoBlock, AForeignDatabaseIsAnError) {
  RawDatabase(kFile).Run("CREATE TABLE other (x)");
  EXPECT_EQ(-1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_EQ(-1, AutoBlockFailLoginSet(kAddress, "SHARING"));
  EXPECT_THAT(log.Texts(), testing::Each(EndsWith("no such table: autoblock")));
}

TEST_F(AutoBlock, NeverFollowsASymlink) {
  const velk_test::TempDir elsewhere;
  fs::create_symlink(elsewhere.File("target"), kFile);
  EXPECT_EQ(-1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_EQ(-1, AutoBlockFailLoginSet(kAddress, "SHARING"));
  EXPECT_THAT(log.Texts(), testing::Each(EndsWith(": not a regular file")));
  EXPECT_FALSE(fs::exists(elsewhere.File("target")));
}

TEST_F(AutoBlock, AFolderInItsPlaceIsAnError) {
  fs::create_directory(kFile);
  EXPECT_EQ(-1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_EQ(-1, AutoBlockFailLoginSet(kAddress, "SHARING"));
  EXPECT_THAT(log.lines(), SizeIs(2));
}

TEST_F(AutoBlock, AFileWithoutPermissionIsAnError) {
  if (geteuid() == 0) GTEST_SKIP() << "root may read everything";
  Fail(10);
  log.Clear();
  fs::permissions(kFile, fs::perms::none);
  EXPECT_EQ(-1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.Texts(), ElementsAre(EndsWith("unable to open database file")));
}

TEST_F(AutoBlock, AFullDiskCountsNothingAndLeavesNothing) {
  EXPECT_EQ(0, RunForked([this] {
              signal(SIGXFSZ, SIG_IGN);
              const rlimit nothing{0, 0};
              setrlimit(RLIMIT_FSIZE, &nothing);
              const int counted = AutoBlockFailLoginSet(kAddress, "SHARING");
              return counted == -1 && log.lines().size() == 1 ? 0 : 1;
            }));
  EXPECT_THAT(Files(), IsEmpty());
}

// ---- settings

TEST_F(AutoBlock, SettingsAreRead) {
  WriteFile(kConfig, "# blocks quickly\n\n  attempts=2   # twice\r\n\twithin = 50\nblock\t= 0\n");
  Fail(1);
  Age(50);
  Fail(1);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  Fail(1);
  Age(2000000000);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.Texts(), ElementsAre("autoblock: blocked 192.0.2.7 for ever, category SHARING"));
}

TEST_F(AutoBlock, OneAttemptBlocksAtOnce) {
  WriteFile(kConfig, "attempts = 1");
  Fail(1);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
  EXPECT_THAT(log.lines(), SizeIs(1));
}

TEST_F(AutoBlock, InstalledExampleMeansTheDefaults) {
  fs::copy_file(VELK_SOURCE_DIR "/packaging/autoblock.conf", kConfig);
  Fail(9);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  Fail(1);
  EXPECT_THAT(log.Texts(),
              ElementsAre("autoblock: blocked 192.0.2.7 for 86400 seconds, category SHARING"));
}

TEST_F(AutoBlock, AMistakeInTheSettingsIsLoggedWithItsLineAndReason) {
  const std::string number = "not a whole number";
  const std::vector<std::pair<std::string, std::string>> mistakes = {
      {"attempts = 5\nwidth = 3\n", "2: unknown key"},
      {"Attempts = 5\n", "1: unknown key"},
      {"= 5\n", "1: unknown key"},
      {"\n# x\nattempts\n", "3: not of the form \"key = value\""},
      {"attempts =\n", "1: " + number},
      {"attempts = ten\n", "1: " + number},
      {"attempts = 5 x\n", "1: " + number},
      {"attempts = 5.5\n", "1: " + number},
      {"attempts = +5\n", "1: " + number},
      {std::string("attempts = 5\0\n", 14), "1: " + number},
      {"attempts = 0\n", "1: not from 1 to 1000000"},
      {"attempts = 1000001\n", "1: not from 1 to 1000000"},
      {"attempts = 99999999999999999999\n", "1: not from 1 to 1000000"},
      {"within = 0\n", "1: not from 1 to 31536000"},
      {"block = -1\n", "1: not from 0 to 315360000"},
      {"attempts = 5\nattempts = 5\n", "2: key given twice"},
  };
  for (const auto &[content, reason] : mistakes) {
    SCOPED_TRACE(content);
    WriteFile(kConfig, content);
    log.Clear();
    EXPECT_EQ(0, VELKAutoBlockResetByIP(kAddress));
    Fail(1);
    ASSERT_THAT(log.lines(), SizeIs(1));
    EXPECT_EQ(LOG_ERR, log.lines()[0].priority);
    EXPECT_EQ("autoblock: " + kConfig + ":" + reason + "; using the defaults", log.lines()[0].text);
  }
}

TEST_F(AutoBlock, AMistakeMeansTheDefaultsForEverything) {
  WriteFile(kConfig, "attempts = 2\nblock = never\n");
  Fail(9);
  EXPECT_EQ(0, VELKAutoBlockIsDenied(kAddress));
  Fail(1);
  EXPECT_EQ(1, VELKAutoBlockIsDenied(kAddress));
}

TEST_F(AutoBlock, UnreadableSettingsAreLogged) {
  fs::create_directory(kConfig);
  Fail(1);
  EXPECT_THAT(log.Texts(), ElementsAre(StartsWith("autoblock: cannot read " + kConfig + ": ")));
}

}  // namespace
