// Opening a database switches the process to the system account (1:1) and back. The system calls
// that do so, and the platform calls in between, are replaced here: what is asked of them is
// written down, and the kernel's rules are played on ids of our own.

#include <gmock/gmock.h>
#include <syslog.h>
#include <velk/velkcore.h>
#include <velk/velkdb.h>
#include <velksharing/database.h>

#include <cerrno>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/log_capture.h"
#include "support/temp_dir.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;
using VELK::sharing::db::BaseDB;
using velk_test::LogCapture;
using velk_test::LogLine;

using Trace = std::vector<std::string>;

constexpr unsigned int kKeep = static_cast<unsigned int>(-1);

/// The three ids of one kind that a process has.
struct Ids {
  unsigned int real;
  unsigned int effective;
  unsigned int saved;

  bool Has(unsigned int id) const { return id == real || id == effective || id == saved; }
};

/// The process's ids, and what happened to them.
struct Kernel {
  Ids user;
  Ids group;
  std::set<int> failing;  ///< The changes that fail, counted from 1, whatever the rules say.
  Trace trace = {};
  int changes = 0;

  int Change(const char *call, Ids &ids, unsigned int real, unsigned int effective,
             unsigned int saved) {
    const auto text = [](unsigned int id) { return std::to_string(static_cast<int>(id)); };
    trace.push_back(std::string(call) + "(" + text(real) + ", " + text(effective) + ", " +
                    text(saved) + ")");
    const bool permitted = user.effective == 0 || ids.Has(effective);
    if (real != kKeep || saved != kKeep || failing.contains(++changes) || !permitted) {
      errno = EPERM;
      return -1;
    }
    ids.effective = effective;
    return 0;
  }

  void Note(const std::string &what) {
    trace.push_back(what + " as " + std::to_string(user.effective) + ":" +
                    std::to_string(group.effective));
  }
};

Kernel kernel;
bool connect_throws = false;

}  // namespace

uid_t geteuid() noexcept {
  return kernel.user.effective;
}
gid_t getegid() noexcept {
  return kernel.group.effective;
}
int setresuid(uid_t real, uid_t effective, uid_t saved) noexcept {
  return kernel.Change("setresuid", kernel.user, real, effective, saved);
}
int setresgid(gid_t real, gid_t effective, gid_t saved) noexcept {
  return kernel.Change("setresgid", kernel.group, real, effective, saved);
}
int VLIBCFileTouch(const char *) {
  kernel.Note("touch");
  return -1;
}
VELKDBHandle *VELKDBConnect(const char *, const char *, const char *, const char *) {
  kernel.Note("connect");
  if (connect_throws) throw std::runtime_error("connect");
  return nullptr;
}

namespace {

class RunAs : public testing::Test {
 protected:
  RunAs() {
    velk_test::WriteFile(folder_.File("there.db"), "");
    connect_throws = false;
  }

  /// What happens when a process with these ids opens a database that is there.
  Trace Open(Ids user, Ids group, std::set<int> failing = {}) {
    return Open("there.db", user, group, std::move(failing));
  }
  Trace Open(const std::string &name, Ids user, Ids group, std::set<int> failing) {
    kernel = Kernel{user, group, std::move(failing)};
    log_.Clear();
    EXPECT_FALSE(BaseDB(folder_.File(name), 0660).IsGood());
    return kernel.trace;
  }

  /// The guard's own lines.
  std::vector<LogLine> Complaints() const {
    std::vector<LogLine> complaints;
    for (const LogLine &line : log_.lines())
      if (line.format.find("ERROR") != std::string::npos) complaints.push_back(line);
    return complaints;
  }

  velk_test::TempDir folder_;
  LogCapture log_;
};

MATCHER(IsRefusedSwitch, "") {
  return arg.priority == (LOG_AUTH | LOG_ERR) && arg.format == "%s:%d ERROR: %s(%d, %d)" &&
         testing::Matches(MatchesRegex("base_db:[0-9]+ ERROR: IF_RUN_AS\\(1, 1\\)"))(arg.text);
}

MATCHER_P(IsRefusedReturnTo, ids, "") {
  return arg.priority == (LOG_AUTH | LOG_CRIT) && arg.format == "%s:%d ERROR: ~%s(%d, %d)" &&
         testing::Matches(MatchesRegex("base_db:[0-9]+ ERROR: ~IF_RUN_AS\\(" + std::string(ids) +
                                       "\\)"))(arg.text);
}

constexpr Ids kRoot{0, 0, 0};
constexpr Ids kSystem{1, 1, 1};
constexpr Ids kVisitor{1000, 1000, 1000};
constexpr Ids kVisitorForNow{0, 1000, 0};  // may become root again

// ---- What is asked of the kernel

TEST_F(RunAs, RootTakesOnGroupThenUserAndReturns) {
  EXPECT_THAT(Open(kRoot, kRoot),
              ElementsAre("setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)", "connect as 1:1",
                          "setresuid(-1, 0, -1)", "setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

TEST_F(RunAs, RootOfTheSystemGroupKeepsTheGroup) {
  EXPECT_THAT(Open(kRoot, kSystem), ElementsAre("setresuid(-1, 1, -1)", "connect as 1:1",
                                                "setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)"));
}

TEST_F(RunAs, TheSystemAccountChangesNothing) {
  EXPECT_THAT(Open(kSystem, kSystem), ElementsAre("connect as 1:1"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

TEST_F(RunAs, TheSystemAccountInAnotherGroupChangesTheGroupAlone) {
  EXPECT_THAT(Open(kSystem, {5, 5, 1}),
              ElementsAre("setresgid(-1, 1, -1)", "connect as 1:1", "setresgid(-1, 5, -1)"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

TEST_F(RunAs, AnAccountThatMayBecomeRootDoesSoBothWays) {
  EXPECT_THAT(Open(kVisitorForNow, kVisitorForNow),
              ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)",
                          "connect as 1:1", "setresuid(-1, 0, -1)", "setresgid(-1, 1000, -1)",
                          "setresuid(-1, 1000, -1)"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

TEST_F(RunAs, AnAccountOfTheSystemGroupThatMayBecomeRootKeepsTheGroup) {
  EXPECT_THAT(Open(kVisitorForNow, kSystem),
              ElementsAre("setresuid(-1, 0, -1)", "setresuid(-1, 1, -1)", "connect as 1:1",
                          "setresuid(-1, 0, -1)", "setresuid(-1, 1000, -1)"));
}

TEST_F(RunAs, AMissingFileIsMadeUnderTheSystemAccount) {
  EXPECT_THAT(Open("missing.db", kRoot, kRoot, {}),
              ElementsAre("setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)", "touch as 1:1",
                          "setresuid(-1, 0, -1)", "setresgid(-1, 0, -1)", "setresuid(-1, 0, -1)"));
}

TEST_F(RunAs, AnUnknownUserIsNotReturnedTo) {
  EXPECT_THAT(Open({0, kKeep, 0}, kSystem),
              ElementsAre("setresuid(-1, 0, -1)", "setresuid(-1, 1, -1)", "connect as 1:1",
                          "setresuid(-1, 0, -1)"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

TEST_F(RunAs, AnUnknownGroupIsNotReturnedTo) {
  EXPECT_THAT(Open(kRoot, {0, kKeep, 0}),
              ElementsAre("setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)", "connect as 1:1",
                          "setresuid(-1, 0, -1)", "setresuid(-1, 0, -1)"));
}

// ---- A switch that fails

TEST_F(RunAs, AnAccountThatMayNotBecomeRootIsRefused) {
  EXPECT_THAT(Open(kVisitor, kVisitor), ElementsAre("setresuid(-1, 0, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
  EXPECT_EQ(log_.lines().size(), 2u);
  EXPECT_THAT(log_.lines().back().text,
              MatchesRegex("base_db:[0-9]+ \\([0-9]+\\) failed to run as system\n\n"));
}

TEST_F(RunAs, TheSystemAccountThatMayNotChangeItsGroupIsRefused) {
  EXPECT_THAT(Open(kSystem, {5, 5, 5}), ElementsAre("setresgid(-1, 1, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
}

TEST_F(RunAs, RootThatCannotChangeTheGroupHasNothingToReturnFrom) {
  EXPECT_THAT(Open(kRoot, kRoot, {1}), ElementsAre("setresgid(-1, 1, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
}

TEST_F(RunAs, RootThatCannotChangeTheUserReturnsToItsGroup) {
  EXPECT_THAT(Open(kRoot, kRoot, {2}),
              ElementsAre("setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)", "setresgid(-1, 0, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
}

TEST_F(RunAs, AnAccountThatCannotChangeTheGroupReturnsToItsUser) {
  EXPECT_THAT(
      Open(kVisitorForNow, kVisitorForNow, {2}),
      ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1000, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
}

TEST_F(RunAs, AnAccountThatCannotChangeTheUserReturnsToItsGroupAndUser) {
  EXPECT_THAT(Open(kVisitorForNow, kVisitorForNow, {3}),
              ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)",
                          "setresgid(-1, 1000, -1)", "setresuid(-1, 1000, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedSwitch()));
}

// ---- A return that fails

TEST_F(RunAs, AReturnThatCannotBecomeRootEndsThere) {
  EXPECT_THAT(Open(kVisitorForNow, kVisitorForNow, {4}),
              ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)",
                          "connect as 1:1", "setresuid(-1, 0, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedReturnTo("1000, 1000")));
}

TEST_F(RunAs, AReturnThatCannotChangeTheGroupEndsThere) {
  EXPECT_THAT(Open(kVisitorForNow, {0, 2000, 0}, {5}),
              ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)",
                          "connect as 1:1", "setresuid(-1, 0, -1)", "setresgid(-1, 2000, -1)"));
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedReturnTo("1000, 2000")));
}

TEST_F(RunAs, AReturnThatCannotChangeTheUserIsLogged) {
  EXPECT_EQ(Open(kVisitorForNow, kVisitorForNow, {6}).back(), "setresuid(-1, 1000, -1)");
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedReturnTo("1000, 1000")));
}

TEST_F(RunAs, AReturnOfTheGroupAloneThatFailsIsLogged) {
  EXPECT_EQ(Open(kSystem, {5, 5, 1}, {2}).back(), "setresgid(-1, 5, -1)");
  EXPECT_THAT(Complaints(), ElementsAre(IsRefusedReturnTo("1, 5")));
}

TEST_F(RunAs, ASwitchAndItsReturnThatFailAreBothLogged) {
  EXPECT_THAT(
      Open(kVisitorForNow, kVisitorForNow, {2, 3}),
      ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1000, -1)"));
  EXPECT_EQ(Complaints().size(), 2u);
  EXPECT_THAT(Complaints(),
              testing::UnorderedElementsAre(IsRefusedSwitch(), IsRefusedReturnTo("1000, 1000")));
}

// ---- An exception

TEST_F(RunAs, AnExceptionReturnsOnItsWayOut) {
  connect_throws = true;
  kernel = Kernel{kVisitorForNow, kVisitorForNow, {}};
  EXPECT_THROW(BaseDB(folder_.File("there.db"), 0660), std::runtime_error);
  EXPECT_THAT(kernel.trace,
              ElementsAre("setresuid(-1, 0, -1)", "setresgid(-1, 1, -1)", "setresuid(-1, 1, -1)",
                          "connect as 1:1", "setresuid(-1, 0, -1)", "setresgid(-1, 1000, -1)",
                          "setresuid(-1, 1000, -1)"));
  EXPECT_THAT(Complaints(), IsEmpty());
}

}  // namespace
