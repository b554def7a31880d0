#include "share/shared_tree.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "share_support.h"
#include "support/log_capture.h"
#include "support/temp_dir.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using velk_test::LogCapture;
using velk_test::WriteFile;
using web::share::Item;
using web::share::SharedTree;
using web_test::ContentOf;
using web_test::IdOfNobodyAtAll;
using web_test::SharedFolder;
using web_test::Sharer;

using Parts = std::vector<std::string>;

// --- What a link names --------------------------------------------------------------------------

TEST(ShareTree, OpensAFile) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "hello");
  const auto tree = SharedTree::Open(folder.File("a.txt"), Sharer());
  ASSERT_TRUE(tree);
  EXPECT_FALSE(tree->IsFolder());
  EXPECT_EQ(tree->name(), "a.txt");
  const auto item = tree->Find({});
  ASSERT_TRUE(item);
  EXPECT_EQ(item->name, "a.txt");
  EXPECT_EQ(item->size, 5);
  EXPECT_EQ(ContentOf(*item), "hello");
}

TEST(ShareTree, OpensAFolder) {
  const SharedFolder folder;
  const auto tree = SharedTree::Open(folder.path(), Sharer());
  ASSERT_TRUE(tree);
  EXPECT_TRUE(tree->IsFolder());
  EXPECT_EQ(tree->name(), "shared");
  EXPECT_TRUE(tree->Find({})->is_folder);
}

TEST(ShareTree, TakesAFolderWithSlashesAtItsEnd) {
  const SharedFolder folder;
  EXPECT_EQ(SharedTree::Open(folder.path() + "//", Sharer())->name(), "shared");
}

TEST(ShareTree, FollowsTheLinkThatTheOwnerNamed) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "hello");
  folder.AddLink("b.txt", "a.txt");
  EXPECT_EQ(ContentOf(*SharedTree::Open(folder.File("b.txt"), Sharer())->Find({})), "hello");
}

TEST(ShareTree, AFileHasNothingBelow) {
  const SharedFolder folder;
  folder.AddFile("a.txt");
  const auto tree = SharedTree::Open(folder.File("a.txt"), Sharer());
  EXPECT_FALSE(tree->Find({"a.txt"}));
  EXPECT_FALSE(tree->Find({"b"}));
}

class UnusablePath : public testing::TestWithParam<std::string> {};

TEST_P(UnusablePath, IsNotFound) {
  const LogCapture log;
  EXPECT_FALSE(SharedTree::Open(GetParam(), Sharer()));
  EXPECT_EQ(log.lines().size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(ShareTree, UnusablePath,
                         testing::Values("", "relative", "./x", "../../etc/passwd", "~/x",
                                         "/nowhere/at/all", std::string("/tmp\0/x", 7), "/dev/null",
                                         "/dev/zero", "/proc", "/proc/self/maps",
                                         "/proc/self/environ", "/proc/self/root/etc/passwd",
                                         "/proc/self/fd/0", "/dev/fd/0", "/dev/stdin",
                                         "/etc/passwd/"));

TEST(ShareTree, APathTooLongForTheSystemIsNotFound) {
  const LogCapture log;
  EXPECT_FALSE(SharedTree::Open(std::string(10'000, '/') + "etc/passwd", Sharer()));
}

TEST(ShareTree, AnOwnerWhoIsGoneSharesNothing) {
  const SharedFolder folder;
  const LogCapture log;
  EXPECT_FALSE(SharedTree::Open(folder.path(), IdOfNobodyAtAll()));
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("there is no such account")));
}

TEST(ShareTree, AFileThatItsOwnerMayNotReadIsNotFound) {
  const SharedFolder folder;
  folder.AddFile("secret");
  chmod(folder.File("secret").c_str(), 0);
  const LogCapture log;
  EXPECT_FALSE(SharedTree::Open(folder.File("secret"), Sharer()));
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("Permission denied")));
}

TEST(ShareTree, NoFileNameForgesALineOfTheLog) {
  const LogCapture log;
  SharedTree::Open("/nowhere\nNov 21 sshd: root came in", Sharer());
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("/nowhere_Nov 21")));
}

// --- What is in it ------------------------------------------------------------------------------

TEST(ShareTree, FindsAFileInAFolderInAFolder) {
  const SharedFolder folder;
  folder.AddFolder("a");
  folder.AddFolder("a/b");
  folder.AddFile("a/b/c.txt", "deep");
  const Item item = folder.Find({"a", "b", "c.txt"});
  EXPECT_EQ(item.name, "c.txt");
  EXPECT_EQ(item.parts, (Parts{"a", "b", "c.txt"}));
  EXPECT_EQ(ContentOf(item), "deep");
}

TEST(ShareTree, TellsWhenAFileHasChanged) {
  const SharedFolder folder;
  folder.AddFile("a");
  const timespec times[2] = {{1, 0}, {1'600'000'000, 123'456'789}};
  utimensat(AT_FDCWD, folder.File("a").c_str(), times, 0);
  const Item item = folder.Find({"a"});
  EXPECT_EQ(item.changed.tv_sec, 1'600'000'000);
  EXPECT_EQ(item.changed.tv_nsec, 123'456'789);
}

TEST(ShareTree, TakesNamesOfAnyBytes) {
  const SharedFolder folder;
  for (const std::string name : {"br\xF6ken", "new\nline", "Größe", " ", "a\\b", "%2e%2e", "-rf",
                                 "\xFF\xFE", "…", "a..", "*"}) {
    folder.AddFile(name, "of " + name);
    EXPECT_EQ(ContentOf(folder.Find({name})), "of " + name);
  }
}

TEST(ShareTree, AFileThatItsOwnerMayNotReadIsNotFoundInAFolderEither) {
  const SharedFolder folder;
  folder.AddFile("secret");
  chmod(folder.File("secret").c_str(), 0);
  EXPECT_FALSE(folder.Has({"secret"}));
}

TEST(ShareTree, WhatHasADotInFrontIsHidden) {
  const SharedFolder folder;
  folder.AddFile(".htpasswd");
  folder.AddFolder(".git");
  folder.AddFile(".git/config");
  EXPECT_FALSE(folder.Has({".htpasswd"}));
  EXPECT_FALSE(folder.Has({".git"}));
  EXPECT_FALSE(folder.Has({".git", "config"}));
}

TEST(ShareTree, WhatTellsOfProcessesIsNotFoundBelowAFolderEither) {
  const auto tree = SharedTree::Open("/", Sharer());
  ASSERT_TRUE(tree);
  EXPECT_TRUE(tree->Find({"usr"}));
  EXPECT_FALSE(tree->Find({"proc"}));
  EXPECT_FALSE(tree->Find({"proc", "version"}));
  EXPECT_FALSE(tree->Find({"proc", "self", "environ"}));
}

TEST(ShareTree, APipeIsNotFoundAndNotWaitedFor) {
  const SharedFolder folder;
  ASSERT_EQ(mkfifo(folder.File("pipe").c_str(), 0666), 0);
  chown(folder.File("pipe").c_str(), Sharer(), static_cast<gid_t>(-1));
  EXPECT_FALSE(folder.Has({"pipe"}));
  EXPECT_FALSE(SharedTree::Open(folder.File("pipe"), Sharer()));
}

TEST(ShareTree, ASocketIsNotFound) {
  const SharedFolder folder;
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  folder.File("socket").copy(address.sun_path, sizeof address.sun_path - 1);
  const web::UniqueFd socket_(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  ASSERT_EQ(bind(socket_.get(), reinterpret_cast<sockaddr *>(&address), sizeof address), 0);
  chmod(folder.File("socket").c_str(), 0666);
  EXPECT_FALSE(folder.Has({"socket"}));
}

TEST(ShareTree, ATreeOutlivesACopyAndAMove) {
  const SharedFolder folder;
  folder.AddFile("a");
  SharedTree tree = folder.Tree();
  const SharedTree copy = tree;
  tree = *SharedTree::Open(folder.File("a"), Sharer());
  EXPECT_TRUE(copy.Find({"a"}));
}

TEST(ShareTree, AFolderThatHasBeenMovedIsStillTheSame) {
  const SharedFolder folder;
  folder.AddFile("a", "moved");
  const SharedTree tree = folder.Tree();
  ASSERT_EQ(rename(folder.path().c_str(), folder.Beside("elsewhere").c_str()), 0);
  EXPECT_EQ(ContentOf(*tree.Find({"a"})), "moved");
}

// --- Symbolic links -----------------------------------------------------------------------------

/// A tree with links of every kind, and a secret beside it.
class ShareTreeLinks : public testing::Test {
 protected:
  ShareTreeLinks() {
    WriteFile(folder_.Beside("secret"), "secret");
    chmod(folder_.Beside("secret").c_str(), 0644);
    folder_.AddFile("public", "public");
    folder_.AddFolder("sub");
    folder_.AddFile("sub/public", "public");
  }

  bool Leads(const std::string &target, const Parts &below = {}) {
    folder_.AddLink("sub/link", target);
    Parts parts = {"sub", "link"};
    parts.insert(parts.end(), below.begin(), below.end());
    return folder_.Has(parts);
  }

  SharedFolder folder_;
};

TEST_F(ShareTreeLinks, ALinkToAFileBesideItIsFollowed) {
  EXPECT_TRUE(Leads("public"));
}
TEST_F(ShareTreeLinks, ALinkUpIsFollowedWithinTheTree) {
  EXPECT_TRUE(Leads("../public"));
}
TEST_F(ShareTreeLinks, ALinkToAFolderOfTheTreeIsFollowed) {
  EXPECT_TRUE(Leads("../sub", {"public"}));
}
TEST_F(ShareTreeLinks, ALinkToTheTreeItselfIsFollowed) {
  EXPECT_TRUE(Leads("..", {"public"}));
}
TEST_F(ShareTreeLinks, ALinkOutOfTheTreeIsNotFound) {
  EXPECT_FALSE(Leads("../../secret"));
}
TEST_F(ShareTreeLinks, ALinkToTheFolderAboveIsNotFound) {
  EXPECT_FALSE(Leads("../..", {"secret"}));
}
TEST_F(ShareTreeLinks, ALinkOutAndBackInIsNotFound) {
  EXPECT_FALSE(Leads("../../shared/public"));
}
TEST_F(ShareTreeLinks, AnAbsoluteLinkIsNotFound) {
  EXPECT_FALSE(Leads(folder_.Beside("secret")));
}
TEST_F(ShareTreeLinks, AnAbsoluteLinkIntoTheTreeIsNotFound) {
  EXPECT_FALSE(Leads(folder_.File("public")));
}
TEST_F(ShareTreeLinks, ALinkToItselfIsNotFound) {
  EXPECT_FALSE(Leads("link"));
}
TEST_F(ShareTreeLinks, ALinkToNothingIsNotFound) {
  EXPECT_FALSE(Leads("nothing"));
}
TEST_F(ShareTreeLinks, ALinkThroughProcIsNotFound) {
  EXPECT_FALSE(Leads("/proc/self/cwd"));
}
TEST_F(ShareTreeLinks, TwoLinksToEachOtherAreNotFound) {
  folder_.AddLink("sub/other", "link");
  EXPECT_FALSE(Leads("other"));
}
TEST_F(ShareTreeLinks, AChainOfLinksThatLeavesIsNotFound) {
  folder_.AddLink("hop", "sub/link");
  EXPECT_FALSE(Leads("../../secret"));
  EXPECT_FALSE(folder_.Has({"hop"}));
}
TEST_F(ShareTreeLinks, AFolderReplacedByALinkOutIsNotFound) {
  const SharedTree tree = folder_.Tree();
  ASSERT_EQ(rename(folder_.File("sub").c_str(), folder_.File("was").c_str()), 0);
  folder_.AddLink("sub", "..");
  EXPECT_FALSE(tree.Find({"sub", "secret"}));
}

// --- Spellings that try to get out --------------------------------------------------------------

/// Ways to write "one up", as they can arrive once an address has been decoded, or has not.
const std::vector<std::string> kUps = {
    "..",
    "../",
    "..\\",
    "../.",
    "./..",
    ".../..",
    "....",
    "..;",
    "..%00",
    "%2e%2e",
    "%2E%2E",
    ".%2e",
    "%2e.",
    "%252e%252e",
    "..%2f",
    "..%5c",
    "..%c0%af",
    "%c0%ae%c0%ae",
    "..%252f",
    "..%u2215",
    "%uff0e%uff0e",
    "\xC0\xAE\xC0\xAE",
    "..\xC0\xAF",
    "\xE0\x80\xAE\xE0\x80\xAE",
    "..\xE2\x88\x95",
    "\xEF\xBC\x8E\xEF\xBC\x8E",
    "\xE2\x80\xA5",
    ".. ",
    "..\t",
    "..\n",
    " ..",
    "..\x01",
    "...",
    "..:",
    "..|",
    std::string("..\0", 3),
    std::string("\0..", 3),
    std::string(".\0.", 3),
    "..//",
    "....//",
    "..././",
    "/..",
    "//..",
    "\\..",
    "\\..\\",
    ".",
    "",
    "/",
    "~",
    "~root",
};

/// Ways to stand with what is wanted: several ups, from inside, in one part or in parts.
std::vector<Parts> SpellingsWith(const std::string &up) {
  return {
      {up, "secret"},
      {up, up, "secret"},
      {"sub", up, up, "secret"},
      {up + "/secret"},
      {up + "secret"},
      {"sub/" + up + "/" + up + "/secret"},
      {"sub", up + "/../secret"},
      {"public", up, up, "secret"},
  };
}

TEST(ShareTree, NoneOfManySpellingsGetsOut) {
  const SharedFolder folder;
  WriteFile(folder.Beside("secret"), "secret");
  folder.AddFolder("sub");
  folder.AddFile("public");
  const SharedTree tree = folder.Tree();
  size_t tried = 0;
  for (const std::string &up : kUps) {
    for (const Parts &parts : SpellingsWith(up)) {
      EXPECT_FALSE(tree.Find(parts)) << testing::PrintToString(parts);
      ++tried;
    }
  }
  EXPECT_GE(tried, 300u);
}

TEST(ShareTree, NoAbsoluteNameGetsOut) {
  const SharedFolder folder;
  WriteFile(folder.Beside("secret"), "secret");
  const SharedTree tree = folder.Tree();
  for (const std::string &name :
       {folder.Beside("secret"), "/" + folder.Beside("secret"), std::string("/etc/passwd"),
        std::string("//etc/passwd"), std::string("\\etc\\passwd"),
        std::string("file:///etc/passwd"), std::string("C:\\secret"),
        std::string("/proc/self/root/etc/passwd")}) {
    EXPECT_FALSE(tree.Find({name})) << name;
  }
}

TEST(ShareTree, NamesAndPathsTooLongForTheSystemAreNotFound) {
  const SharedFolder folder;
  EXPECT_FALSE(folder.Has({std::string(256, 'a')}));
  EXPECT_FALSE(folder.Has({std::string(1'000'000, 'a')}));
  EXPECT_FALSE(folder.Has(Parts(100'000, "a")));
}

// What the table above relies on: the file is there and could be read.
TEST(ShareTree, WhatLiesBesideCouldBeReadByItsOwner) {
  const SharedFolder folder;
  WriteFile(folder.Beside("secret"), "secret");
  EXPECT_TRUE(SharedTree::Open(folder.Beside("secret"), Sharer()));
}

}  // namespace
