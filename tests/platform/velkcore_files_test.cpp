#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <ctime>
#include <string>

#include "support/temp_dir.h"
#include "velk/velkcore.h"

namespace {

using velk_test::ReadFile;
using velk_test::TempDir;
using velk_test::WriteFile;

constexpr int kReserved = -1;

mode_t ModeOf(const std::string &path) {
  struct stat status = {};
  EXPECT_EQ(lstat(path.c_str(), &status), 0);
  return status.st_mode & 07777;
}

time_t ModificationTimeOf(const std::string &path) {
  struct stat status = {};
  EXPECT_EQ(lstat(path.c_str(), &status), 0);
  return status.st_mtime;
}

void SetOldTimes(const std::string &path) {
  const timespec old_times[2] = {{1000, 0}, {1000, 0}};
  ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), old_times, AT_SYMLINK_NOFOLLOW), 0);
}

void Link(const std::string &target, const std::string &path) {
  ASSERT_EQ(symlink(target.c_str(), path.c_str()), 0);
}

/// Sets the umask for a scope.
class Umask {
 public:
  explicit Umask(mode_t mask) : previous_(umask(mask)) {}
  Umask(const Umask &) = delete;
  Umask &operator=(const Umask &) = delete;
  ~Umask() { umask(previous_); }

 private:
  mode_t previous_;
};

TEST(VelkFileExist, IsOneForAFile) {
  const TempDir folder;
  WriteFile(folder.File("here"), "");
  EXPECT_EQ(VLIBCFileExist(folder.File("here").c_str()), 1);
}

TEST(VelkFileExist, IsOneForAFolder) {
  const TempDir folder;
  EXPECT_EQ(VLIBCFileExist(folder.path().c_str()), 1);
}

TEST(VelkFileExist, FollowsALink) {
  const TempDir folder;
  WriteFile(folder.File("here"), "");
  Link("here", folder.File("link"));
  EXPECT_EQ(VLIBCFileExist(folder.File("link").c_str()), 1);
}

TEST(VelkFileExist, IsZeroForADanglingLink) {
  const TempDir folder;
  Link("nowhere", folder.File("link"));
  EXPECT_EQ(VLIBCFileExist(folder.File("link").c_str()), 0);
}

TEST(VelkFileExist, IsZeroForWhatIsMissing) {
  const TempDir folder;
  EXPECT_EQ(VLIBCFileExist(folder.File("nothing").c_str()), 0);
}

TEST(VelkFileExist, IsZeroBelowAFileThatIsNoFolder) {
  const TempDir folder;
  WriteFile(folder.File("file"), "");
  EXPECT_EQ(VLIBCFileExist(folder.File("file/below").c_str()), 0);
}

TEST(VelkFileExist, IsZeroForNullAnEmptyAndAnEndlessPath) {
  EXPECT_EQ(VLIBCFileExist(nullptr), 0);
  EXPECT_EQ(VLIBCFileExist(""), 0);
  EXPECT_EQ(VLIBCFileExist(std::string(1000000, 'x').c_str()), 0);
}

TEST(VelkFileTouch, CreatesAnEmptyFileForItsOwnerAlone) {
  const TempDir folder;
  const Umask none(0);
  ASSERT_EQ(VLIBCFileTouch(folder.File("new").c_str()), 0);
  EXPECT_EQ(ModeOf(folder.File("new")), 0600U);
  EXPECT_EQ(ReadFile(folder.File("new")), "");
}

TEST(VelkFileTouch, TakesTheUmaskOffTheModeOfANewFile) {
  const TempDir folder;
  const Umask no_writing(0222);
  ASSERT_EQ(VLIBCFileTouch(folder.File("new").c_str()), 0);
  EXPECT_EQ(ModeOf(folder.File("new")), 0400U);
}

TEST(VelkFileTouch, KeepsContentAndModeOfAnExistingFile) {
  const TempDir folder;
  WriteFile(folder.File("old"), "content");
  ASSERT_EQ(chmod(folder.File("old").c_str(), 0644), 0);
  ASSERT_EQ(VLIBCFileTouch(folder.File("old").c_str()), 0);
  EXPECT_EQ(ReadFile(folder.File("old")), "content");
  EXPECT_EQ(ModeOf(folder.File("old")), 0644U);
}

TEST(VelkFileTouch, SetsTheTimesOfAnExistingFileToNow) {
  const TempDir folder;
  WriteFile(folder.File("old"), "");
  SetOldTimes(folder.File("old"));
  ASSERT_EQ(VLIBCFileTouch(folder.File("old").c_str()), 0);
  EXPECT_NEAR(static_cast<double>(ModificationTimeOf(folder.File("old"))),
              static_cast<double>(time(nullptr)), 60);
}

TEST(VelkFileTouch, TouchesAReadOnlyFileOfTheCaller) {
  const TempDir folder;
  WriteFile(folder.File("old"), "");
  ASSERT_EQ(chmod(folder.File("old").c_str(), 0400), 0);
  EXPECT_EQ(VLIBCFileTouch(folder.File("old").c_str()), 0);
}

TEST(VelkFileTouch, RefusesALinkAndLeavesItsTargetAlone) {
  const TempDir folder;
  WriteFile(folder.File("target"), "");
  SetOldTimes(folder.File("target"));
  Link("target", folder.File("link"));
  EXPECT_EQ(VLIBCFileTouch(folder.File("link").c_str()), -1);
  EXPECT_EQ(errno, ELOOP);
  EXPECT_EQ(ModificationTimeOf(folder.File("target")), 1000);
}

TEST(VelkFileTouch, CreatesNothingBehindADanglingLink) {
  const TempDir folder;
  Link(folder.File("target"), folder.File("link"));
  EXPECT_EQ(VLIBCFileTouch(folder.File("link").c_str()), -1);
  EXPECT_EQ(errno, ELOOP);
  EXPECT_NE(access(folder.File("target").c_str(), F_OK), 0);
}

TEST(VelkFileTouch, RefusesAFolder) {
  const TempDir folder;
  EXPECT_EQ(VLIBCFileTouch(folder.path().c_str()), -1);
  EXPECT_EQ(errno, EISDIR);
}

TEST(VelkFileTouch, RefusesAPipeWithoutWaitingForItsOtherEnd) {
  const TempDir folder;
  ASSERT_EQ(mkfifo(folder.File("pipe").c_str(), 0600), 0);
  EXPECT_EQ(VLIBCFileTouch(folder.File("pipe").c_str()), -1);
  EXPECT_EQ(errno, EINVAL);
}

TEST(VelkFileTouch, SaysWhyItFailed) {
  const TempDir folder;
  EXPECT_EQ(VLIBCFileTouch(folder.File("missing/new").c_str()), -1);
  EXPECT_EQ(errno, ENOENT);
  EXPECT_EQ(VLIBCFileTouch(std::string(1000000, 'x').c_str()), -1);
  EXPECT_EQ(errno, ENAMETOOLONG);
  EXPECT_EQ(VLIBCFileTouch(nullptr), -1);
  EXPECT_EQ(errno, EINVAL);
}

TEST(VelkFileTouch, FailsInAFolderThatMayNotBeWritten) {
  if (geteuid() == 0) GTEST_SKIP() << "root may write everywhere";
  const TempDir folder;
  ASSERT_EQ(chmod(folder.path().c_str(), 0500), 0);
  EXPECT_EQ(VLIBCFileTouch(folder.File("new").c_str()), -1);
  EXPECT_EQ(errno, EACCES);
}

TEST(VelkFileTouch, LeavesNoDescriptorOpen) {
  const TempDir folder;
  const int before = open("/dev/null", O_RDONLY | O_CLOEXEC);
  close(before);
  ASSERT_EQ(VLIBCFileTouch(folder.File("new").c_str()), 0);
  ASSERT_EQ(VLIBCFileTouch(folder.path().c_str()), -1);
  const int after = open("/dev/null", O_RDONLY | O_CLOEXEC);
  close(after);
  EXPECT_EQ(after, before);
}

TEST(VelkChmod, SetsTheModeWhateverTheUmaskIs) {
  const TempDir folder;
  WriteFile(folder.File("file"), "");
  const Umask everything(0777);
  ASSERT_EQ(VELKFSAclChmod(folder.File("file").c_str(), kReserved, 0660), 0);
  EXPECT_EQ(ModeOf(folder.File("file")), 0660U);
}

TEST(VelkChmod, SetsEachModeFromNothingToAllBits) {
  const TempDir folder;
  WriteFile(folder.File("file"), "");
  for (const unsigned int mode : {0U, 0400U, 0644U, 01777U, 07777U}) {
    ASSERT_EQ(VELKFSAclChmod(folder.File("file").c_str(), kReserved, mode), 0);
    EXPECT_EQ(ModeOf(folder.File("file")), mode);
  }
}

TEST(VelkChmod, WorksOnAFolder) {
  const TempDir folder;
  ASSERT_EQ(mkdir(folder.File("inner").c_str(), 0700), 0);
  ASSERT_EQ(VELKFSAclChmod(folder.File("inner").c_str(), kReserved, 0750), 0);
  EXPECT_EQ(ModeOf(folder.File("inner")), 0750U);
}

TEST(VelkChmod, RefusesALinkAndLeavesItsTargetAlone) {
  const TempDir folder;
  WriteFile(folder.File("target"), "");
  ASSERT_EQ(chmod(folder.File("target").c_str(), 0600), 0);
  Link("target", folder.File("link"));
  EXPECT_EQ(VELKFSAclChmod(folder.File("link").c_str(), kReserved, 0666), -1);
  EXPECT_EQ(errno, ELOOP);
  EXPECT_EQ(ModeOf(folder.File("target")), 0600U);
}

TEST(VelkChmod, FollowsALinkOnTheWay) {
  const TempDir folder;
  ASSERT_EQ(mkdir(folder.File("inner").c_str(), 0700), 0);
  WriteFile(folder.File("inner/file"), "");
  Link("inner", folder.File("way"));
  ASSERT_EQ(VELKFSAclChmod(folder.File("way/file").c_str(), kReserved, 0640), 0);
  EXPECT_EQ(ModeOf(folder.File("inner/file")), 0640U);
}

TEST(VelkChmod, SaysWhyItFailed) {
  const TempDir folder;
  WriteFile(folder.File("file"), "");
  EXPECT_EQ(VELKFSAclChmod(folder.File("missing").c_str(), kReserved, 0600), -1);
  EXPECT_EQ(errno, ENOENT);
  EXPECT_EQ(VELKFSAclChmod(nullptr, kReserved, 0600), -1);
  EXPECT_EQ(errno, EINVAL);
  EXPECT_EQ(VELKFSAclChmod(folder.File("file").c_str(), kReserved, 010000), -1);
  EXPECT_EQ(errno, EINVAL);
}

TEST(VelkChmod, RefusesAFileOfAnotherAccount) {
  if (geteuid() == 0) GTEST_SKIP() << "root may change every mode";
  EXPECT_EQ(VELKFSAclChmod("/etc/passwd", kReserved, 0666), -1);
  EXPECT_EQ(errno, EPERM);
}

}  // namespace
