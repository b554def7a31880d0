#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <regex>
#include <string>

#include "support/process.h"

namespace {

using testing::HasSubstr;
using velk_test::Outcome;
using velk_test::RunProgram;

constexpr char kOnlyRoot[] = "only root has privileges to drop";

/// One line of /proc/self/status, with its blanks made one.
std::string Line(const Outcome &outcome, const std::string &name) {
  EXPECT_EQ(outcome.status, 0) << outcome.err;
  std::smatch found;
  const std::regex line(name + ":([^\n]*)\n");
  if (!std::regex_search(outcome.out, found, line)) return "no such line";
  return std::regex_replace(found[1].str(), std::regex("\\s+"), " ");
}

TEST(WebPrivileges, RootBecomesTheSystemAccount) {
  if (geteuid() != 0) GTEST_SKIP() << kOnlyRoot;
  const Outcome outcome = RunProgram({PRIVILEGES_PROGRAM});
  EXPECT_EQ(Line(outcome, "Uid"), " 65534 65534 65534 65534");
  EXPECT_EQ(Line(outcome, "Gid"), " 65533 65533 65533 65533");
  EXPECT_EQ(Line(outcome, "Groups"), " ");
}

TEST(WebPrivileges, RootKeepsTwoCapabilities) {
  if (geteuid() != 0) GTEST_SKIP() << kOnlyRoot;
  const Outcome outcome = RunProgram({PRIVILEGES_PROGRAM});
  EXPECT_EQ(Line(outcome, "CapPrm"), " 00000000000000c0");
  EXPECT_EQ(Line(outcome, "CapEff"), " 00000000000000c0");
  EXPECT_EQ(Line(outcome, "CapBnd"), " 00000000000000c0");
  EXPECT_EQ(Line(outcome, "CapInh"), " 0000000000000000");
  EXPECT_EQ(Line(outcome, "CapAmb"), " 0000000000000000");
  EXPECT_EQ(Line(outcome, "NoNewPrivs"), " 1");
}

TEST(WebPrivileges, AProgramThatIsStartedGetsNone) {
  if (geteuid() != 0) GTEST_SKIP() << kOnlyRoot;
  const Outcome outcome = RunProgram({PRIVILEGES_PROGRAM, "/bin/cat", "/proc/self/status"});
  EXPECT_EQ(Line(outcome, "CapPrm"), " 0000000000000000");
  EXPECT_EQ(Line(outcome, "CapEff"), " 0000000000000000");
}

TEST(WebPrivileges, RootThatCannotBecomeTheSystemAccountDoesNotStart) {
  if (geteuid() != 0) GTEST_SKIP() << kOnlyRoot;
  for (const char *missing : {"-setuid", "-setgid", "-setpcap"}) {
    const Outcome outcome =
        RunProgram({"/usr/bin/setpriv", "--bounding-set", missing, PRIVILEGES_PROGRAM});
    EXPECT_EQ(outcome.status, 3) << missing;
    EXPECT_THAT(outcome.err, HasSubstr("cannot limit privileges")) << missing;
  }
}

TEST(WebPrivileges, AnAccountWithTheTwoCapabilitiesKeepsThemAndPassesNoneOn) {
  if (geteuid() != 0) GTEST_SKIP() << kOnlyRoot;
  const std::vector<std::string> as_unit = {"/usr/bin/setpriv",
                                            "--reuid",
                                            "1",
                                            "--regid",
                                            "1",
                                            "--clear-groups",
                                            "--inh-caps",
                                            "+setuid,+setgid",
                                            "--ambient-caps",
                                            "+setuid,+setgid",
                                            PRIVILEGES_PROGRAM};
  const Outcome outcome = RunProgram(as_unit);
  EXPECT_EQ(Line(outcome, "Uid"), " 1 1 1 1");
  EXPECT_EQ(Line(outcome, "CapEff"), " 00000000000000c0");
  std::vector<std::string> then_cat = as_unit;
  then_cat.insert(then_cat.end(), {"/bin/cat", "/proc/self/status"});
  EXPECT_EQ(Line(RunProgram(then_cat), "CapEff"), " 0000000000000000");
}

TEST(WebPrivileges, AnybodyElseStaysWhoHeIsAndHidesHisFiles) {
  std::vector<std::string> words = {PRIVILEGES_PROGRAM};
  if (geteuid() == 0)
    words.insert(words.begin(),
                 {"/usr/bin/setpriv", "--reuid", "1", "--regid", "1", "--clear-groups"});
  const Outcome outcome = RunProgram(words);
  EXPECT_EQ(Line(outcome, "CapEff"), " 0000000000000000");
  EXPECT_EQ(Line(outcome, "Umask"), " 0077");
}

}  // namespace
