#include "share/owner_scope.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <grp.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <csignal>
#include <string>
#include <thread>

#include "share/owner.h"
#include "share/shared_tree.h"
#include "share_support.h"
#include "support/log_capture.h"
#include "support/process.h"
#include "support/temp_dir.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using velk_test::LogCapture;
using velk_test::RunForked;
using velk_test::WriteFile;
using web::UniqueFd;
using web::share::CurrentFileRights;
using web::share::FileRights;
using web::share::FindOwner;
using web::share::MaySwitchFileRights;
using web::share::Owner;
using web::share::OwnerScope;
using web::share::SharedTree;
using web_test::IdOfNobodyAtAll;
using web_test::SharedFolder;
using web_test::Sharer;

constexpr uid_t kSystemAccount = 1;
constexpr uid_t kNobody = 65534;
constexpr gid_t kSomeGroup = 54321;

constexpr uint64_t Bit(int capability) {
  return uint64_t{1} << capability;
}

constexpr uint64_t kSwitching = Bit(CAP_SETUID) | Bit(CAP_SETGID);

bool CanOpen(const std::string &path) {
  return UniqueFd(open(path.c_str(), O_RDONLY | O_CLOEXEC)).IsOpen();
}

bool AreSame(const FileRights &left, const FileRights &right) {
  return left.uid == right.uid && left.gid == right.gid && left.groups == right.groups &&
         left.capabilities == right.capabilities;
}

// Becomes an account without any capabilities but these.
bool Become(uid_t uid, uint64_t capabilities) {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct data[_LINUX_CAPABILITY_U32S_3] = {};
  data[0].effective = data[0].permitted = static_cast<uint32_t>(capabilities);
  return prctl(PR_SET_KEEPCAPS, 1) == 0 && setgroups(0, nullptr) == 0 &&
         setresgid(uid, uid, uid) == 0 && setresuid(uid, uid, uid) == 0 &&
         syscall(SYS_capset, &header, data) == 0;
}

TEST(ShareOwner, HasTheGroupsOfTheAccount) {
  const auto owner = FindOwner(Sharer());
  ASSERT_TRUE(owner);
  EXPECT_EQ(owner->uid, Sharer());
  EXPECT_THAT(owner->groups, Contains(owner->gid));
}

TEST(ShareOwner, IsNobodyForAnIdWithoutAnAccount) {
  EXPECT_FALSE(FindOwner(IdOfNobodyAtAll()));
  EXPECT_FALSE(FindOwner(static_cast<uid_t>(-1)));
}

/// For what only root can show: it has all capabilities to begin with.
class ShareOwnerScope : public testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "only root can switch ids";
    WriteFile(folder_.Beside("of_root"), "of root");
    chmod(folder_.Beside("of_root").c_str(), 0600);
    folder_.AddFile("of_nobody");
    chmod(folder_.File("of_nobody").c_str(), 0600);
  }

  std::string OfRoot() const { return folder_.Beside("of_root"); }
  std::string OfNobody() const { return folder_.File("of_nobody"); }
  /// Makes a file that root and a group may read.
  std::string OfGroup(gid_t group) const {
    std::string path = folder_.Beside("of_group");
    WriteFile(path, "of a group");
    EXPECT_EQ(chmod(path.c_str(), 0640), 0);
    EXPECT_EQ(chown(path.c_str(), 0, group), 0);
    return path;
  }

  SharedFolder folder_;
  const Owner nobody_ = {kNobody, kNobody, {kNobody, kSomeGroup}};
};

TEST_F(ShareOwnerScope, OpensAsTheOwnerAndAsNobodyElse) {
  const OwnerScope as_nobody(nobody_);
  ASSERT_TRUE(as_nobody.IsEntered());
  EXPECT_TRUE(CanOpen(OfNobody()));
  EXPECT_FALSE(CanOpen(OfRoot()));
}

TEST_F(ShareOwnerScope, TakesOnIdsAndGroups) {
  const OwnerScope as_nobody(nobody_);
  const FileRights rights = CurrentFileRights();
  EXPECT_EQ(rights.uid, kNobody);
  EXPECT_EQ(rights.gid, kNobody);
  EXPECT_THAT(rights.groups, testing::ElementsAre(kSomeGroup));
}

TEST_F(ShareOwnerScope, LeavesTheProcessesOtherIdsAlone) {
  const OwnerScope as_nobody(nobody_);
  EXPECT_EQ(geteuid(), 0u);
  EXPECT_EQ(getegid(), 0u);
}

TEST_F(ShareOwnerScope, GivesEverythingBack) {
  const FileRights before = CurrentFileRights();
  { const OwnerScope as_nobody(nobody_); }
  EXPECT_TRUE(AreSame(CurrentFileRights(), before));
  EXPECT_TRUE(CanOpen(OfRoot()));
}

TEST_F(ShareOwnerScope, OpensByEveryGroupOfTheOwner) {
  for (const gid_t group : nobody_.groups) {
    const std::string path = OfGroup(group);
    const OwnerScope as_nobody(nobody_);
    EXPECT_TRUE(CanOpen(path)) << group;
  }
}

TEST_F(ShareOwnerScope, OpensByTheGroupOfAnOwnerWithoutOthers) {
  const std::string path = OfGroup(kNobody);
  const OwnerScope as_nobody({kNobody, kNobody, {kNobody}});
  EXPECT_TRUE(CanOpen(path));
}

TEST_F(ShareOwnerScope, AnOwnerWithoutFurtherGroupsHasNoneOfTheProcess) {
  const std::string path = OfGroup(kSomeGroup);
  EXPECT_EQ(RunForked([&] {
              if (setgroups(1, &kSomeGroup) != 0) return 1;
              {
                const OwnerScope as_nobody({kNobody, kNobody, {kNobody}});
                if (!as_nobody.IsEntered() || CanOpen(path)) return 2;
              }
              return CurrentFileRights().groups == std::vector<gid_t>{kSomeGroup} ? 0 : 3;
            }),
            0);
}

TEST_F(ShareOwnerScope, LosesTheGroupsOfTheProcess) {
  const std::string path = OfGroup(0);
  const OwnerScope as_nobody(nobody_);
  EXPECT_FALSE(CanOpen(path));
}

TEST_F(ShareOwnerScope, ChangesNoOtherThread) {
  const OwnerScope as_nobody(nobody_);
  FileRights other;
  std::thread([&] {
    const OwnerScope as_system({kSystemAccount, kSystemAccount, {}});
    other = CurrentFileRights();
  }).join();
  EXPECT_EQ(other.uid, kSystemAccount);
  EXPECT_EQ(CurrentFileRights().uid, kNobody);
  EXPECT_EQ(CurrentFileRights().groups.size(), 1u);
}

TEST_F(ShareOwnerScope, ASystemAccountWithTwoCapabilitiesOpensAsTheOwner) {
  EXPECT_EQ(RunForked([&] {
              if (!Become(kSystemAccount, kSwitching)) return 1;
              if (CanOpen(OfNobody())) return 2;
              const FileRights before = CurrentFileRights();
              {
                const OwnerScope as_nobody(nobody_);
                if (!as_nobody.IsEntered() || !CanOpen(OfNobody())) return 3;
                if (CanOpen(OfRoot())) return 4;
              }
              if (CanOpen(OfNobody())) return 5;
              return AreSame(CurrentFileRights(), before) ? 0 : 6;
            }),
            0);
}

TEST_F(ShareOwnerScope, CapabilitiesThatGoPastPermissionsAreNotUsed) {
  EXPECT_EQ(RunForked([&] {
              if (!Become(kSystemAccount,
                          kSwitching | Bit(CAP_DAC_READ_SEARCH) | Bit(CAP_DAC_OVERRIDE))) {
                return 1;
              }
              if (!CanOpen(OfRoot())) return 2;
              {
                const OwnerScope as_nobody(nobody_);
                if (!CanOpen(OfNobody()) || CanOpen(OfRoot())) return 3;
              }
              return CanOpen(OfRoot()) ? 0 : 4;
            }),
            0);
}

TEST_F(ShareOwnerScope, AProcessWithoutCapabilitiesOpensAsItself) {
  EXPECT_EQ(RunForked([&] {
              if (!Become(kNobody, 0) || MaySwitchFileRights()) return 1;
              const FileRights before = CurrentFileRights();
              const OwnerScope as_somebody({kSystemAccount, kSystemAccount, {}});
              if (!as_somebody.IsEntered()) return 2;
              return CanOpen(OfNobody()) && AreSame(CurrentFileRights(), before) ? 0 : 3;
            }),
            0);
}

TEST_F(ShareOwnerScope, OneOfTheTwoCapabilitiesIsNotEnough) {
  EXPECT_EQ(RunForked([&] {
              if (!Become(kSystemAccount, Bit(CAP_SETUID)) || MaySwitchFileRights()) return 1;
              const OwnerScope as_nobody(nobody_);
              return CurrentFileRights().uid == kSystemAccount ? 0 : 2;
            }),
            0);
}

TEST_F(ShareOwnerScope, NothingIsOpenedAsRoot) {
  const LogCapture log;
  const OwnerScope as_root({0, 0, {0}});
  EXPECT_FALSE(as_root.IsEntered());
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("a link of root is not served")));
}

TEST_F(ShareOwnerScope, ALinkOfRootIsNotFound) {
  const LogCapture log;
  EXPECT_FALSE(SharedTree::Open(folder_.path(), 0));
}

TEST_F(ShareOwnerScope, AProcessWithoutCapabilitiesServesLinksOfRootAsItself) {
  EXPECT_EQ(RunForked([&] {
              if (!Become(kNobody, 0)) return 1;
              return SharedTree::Open(OfNobody(), 0) && !SharedTree::Open(OfRoot(), 0) ? 0 : 2;
            }),
            0);
}

TEST_F(ShareOwnerScope, AnIdThatTheKernelRefusesOpensNothing) {
  const LogCapture log;
  const FileRights before = CurrentFileRights();
  const OwnerScope as_invalid({static_cast<uid_t>(-1), kNobody, {kNobody}});
  EXPECT_TRUE(AreSame(CurrentFileRights(), before));
  EXPECT_FALSE(as_invalid.IsEntered());
}

TEST_F(ShareOwnerScope, AProcessThatCannotGetBackEnds) {
  EXPECT_EQ(RunForked([&] {
              const rlimit no_core = {0, 0};
              setrlimit(RLIMIT_CORE, &no_core);
              if (!Become(kSystemAccount, kSwitching)) return 1;
              const OwnerScope as_nobody(nobody_);
              if (!Become(kSystemAccount, 0)) return 2;
              return 3;
            }),
            128 + SIGABRT);
}

TEST_F(ShareOwnerScope, TheSignalOfAParentsDeathIsKept) {
  EXPECT_EQ(RunForked([&] {
              prctl(PR_SET_PDEATHSIG, SIGTERM);
              { const OwnerScope as_nobody(nobody_); }
              int death_signal = 0;
              prctl(PR_GET_PDEATHSIG, &death_signal);
              return death_signal == SIGTERM ? 0 : 1;
            }),
            0);
}

TEST_F(ShareOwnerScope, ATreeLeavesTheThreadAsItWas) {
  const FileRights before = CurrentFileRights();
  const SharedTree tree = folder_.Tree();
  EXPECT_TRUE(tree.Find({"of_nobody"}));
  EXPECT_FALSE(tree.Find({"nothing"}));
  EXPECT_TRUE(AreSame(CurrentFileRights(), before));
}

TEST_F(ShareOwnerScope, ATreeShowsOnlyWhatTheOwnerMayRead) {
  WriteFile(folder_.File("of_root"), "of root");
  chmod(folder_.File("of_root").c_str(), 0600);
  EXPECT_TRUE(folder_.Has({"of_nobody"}));
  EXPECT_FALSE(folder_.Has({"of_root"}));
}

}  // namespace
