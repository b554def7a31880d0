#include "share/zip.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <locale.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "share/zip_walk.h"
#include "share_support.h"
#include "support/log_capture.h"
#include "support/process.h"
#include "support/temp_dir.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::UnorderedElementsAre;
using velk_test::LogCapture;
using velk_test::ReadFile;
using velk_test::RunProgram;
using velk_test::TempDir;
using velk_test::WriteFile;
using web::Response;
using web::StreamBody;
using web::share::kMaxZipDepth;
using web::share::MakeZip;
using web::share::SharedTree;
using web::share::ZipWalk;
using web_test::SharedFolder;

using Parts = std::vector<std::string>;

StreamBody &BodyOf(Response &response) {
  return *std::get<std::unique_ptr<StreamBody>>(response.body);
}

Response ZipOf(const SharedFolder &folder, const Parts &names = {}, const Parts &parts = {}) {
  const SharedTree tree = folder.Tree();
  return MakeZip(tree, tree.Find(parts).value(), names).value();
}

// Reads to the end, in pieces of this size. False when the body breaks off.
bool ReadAll(StreamBody &body, std::string &content, size_t piece = 10'000) {
  std::string buffer(piece, '\0');
  while (true) {
    const ssize_t count = body.Read(buffer.data(), buffer.size());
    if (count <= 0) return count == 0;
    content.append(buffer, 0, static_cast<size_t>(count));
  }
}

/// An archive as another program reads it.
class Unpacked {
 public:
  explicit Unpacked(Response response, size_t piece = 10'000) {
    std::string content;
    EXPECT_TRUE(ReadAll(BodyOf(response), content, piece));
    WriteFile(Archive(), content);
  }

  // One line for each entry.
  std::string Tell(const std::string &expression) const {
    const auto outcome = RunProgram({"python3", "-c",
                                     "import sys, zipfile\n"
                                     "archive = zipfile.ZipFile(sys.argv[1])\n"
                                     "assert archive.testzip() is None\n"
                                     "for e in sorted(archive.infolist(), key=lambda e: "
                                     "e.filename):\n  print(" +
                                         expression + ")",
                                     Archive()},
                                    "", {"PYTHONUTF8=1", "TZ=UTC"});
    EXPECT_EQ(outcome.status, 0) << outcome.err;
    return outcome.out;
  }
  std::string Names() const { return Tell("e.filename"); }

  std::string ContentOf(const std::string &name) const {
    const auto outcome =
        RunProgram({"python3", "-c",
                    "import sys, zipfile\n"
                    "sys.stdout.buffer.write(zipfile.ZipFile(sys.argv[1]).read(sys.argv[2]))",
                    Archive(), name},
                   "", {"PYTHONUTF8=1"});
    EXPECT_EQ(outcome.status, 0) << outcome.err;
    return outcome.out;
  }

 private:
  std::string Archive() const { return folder_.File("archive.zip"); }

  TempDir folder_;
};

// Bytes that no compression makes smaller, the same each time.
std::string Noise(size_t size) {
  std::string noise(size, '\0');
  uint32_t state = 1;
  for (char &byte : noise) {
    state = state * 1664525 + 1013904223;
    byte = static_cast<char>(state >> 24);
  }
  return noise;
}

TEST(ShareZip, HoldsEverythingByteForByte) {
  const SharedFolder folder;
  const std::string noise = Noise(300'000);
  folder.AddFile("a.txt", "hello");
  folder.AddFolder("sub");
  folder.AddFolder("sub/deeper");
  folder.AddFile("sub/deeper/noise.bin", noise);
  folder.AddFile("sub/noise.jpg", noise);
  const Unpacked archive(ZipOf(folder));
  EXPECT_EQ(archive.Names(), "a.txt\nsub/\nsub/deeper/\nsub/deeper/noise.bin\nsub/noise.jpg\n");
  EXPECT_EQ(archive.ContentOf("a.txt"), "hello");
  EXPECT_EQ(archive.ContentOf("sub/deeper/noise.bin"), noise);
  EXPECT_EQ(archive.ContentOf("sub/noise.jpg"), noise);
}

TEST(ShareZip, IsTheSameHoweverItIsRead) {
  const SharedFolder folder;
  folder.AddFile("a.bin", Noise(100'000));
  std::string small_pieces;
  std::string large_pieces;
  Response first = ZipOf(folder);
  Response second = ZipOf(folder);
  EXPECT_TRUE(ReadAll(BodyOf(first), small_pieces, 1));
  EXPECT_TRUE(ReadAll(BodyOf(second), large_pieces, 1'000'000));
  EXPECT_EQ(small_pieces, large_pieces);
}

TEST(ShareZip, EndsAgainAfterItsEnd) {
  const SharedFolder folder;
  Response response = ZipOf(folder);
  std::string content;
  ASSERT_TRUE(ReadAll(BodyOf(response), content));
  char byte = 0;
  EXPECT_EQ(BodyOf(response).Read(&byte, 1), 0);
}

TEST(ShareZip, OfAnEmptyFolderIsAnArchive) {
  const SharedFolder folder;
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "");
}

TEST(ShareZip, HoldsEmptyFilesAndFolders) {
  const SharedFolder folder;
  folder.AddFile("empty", "");
  folder.AddFolder("none");
  const Unpacked archive(ZipOf(folder));
  EXPECT_EQ(archive.Names(), "empty\nnone/\n");
  EXPECT_EQ(archive.ContentOf("empty"), "");
}

TEST(ShareZip, OfAFolderInsideHasItsNamesFromThere) {
  const SharedFolder folder;
  folder.AddFolder("sub");
  folder.AddFile("sub/a");
  EXPECT_EQ(Unpacked(ZipOf(folder, {}, {"sub"})).Names(), "a\n");
}

TEST(ShareZip, IsCalledLikeTheFolder) {
  const SharedFolder folder;
  folder.AddFolder("Fotos Süd");
  const Response response = ZipOf(folder, {}, {"Fotos Süd"});
  EXPECT_EQ(response.headers.Get("Content-Type"), "application/zip");
  EXPECT_EQ(response.headers.Get("Content-Disposition"),
            "attachment; filename=\"Fotos S_d.zip\"; filename*=UTF-8''Fotos%20S%C3%BCd.zip");
}

// --- Selections ---------------------------------------------------------------------------------

TEST(ShareZip, OfASelectionHoldsThatAlone) {
  const SharedFolder folder;
  folder.AddFile("a");
  folder.AddFile("b");
  folder.AddFolder("c");
  folder.AddFile("c/d");
  EXPECT_EQ(Unpacked(ZipOf(folder, {"c", "a"})).Names(), "a\nc/\nc/d\n");
}

TEST(ShareZip, HoldsWhatIsSelectedTwiceOnce) {
  const SharedFolder folder;
  folder.AddFile("a");
  EXPECT_EQ(Unpacked(ZipOf(folder, {"a", "a"})).Names(), "a\n");
}

TEST(ShareZip, IsNotMadeOfWhatIsNotThere) {
  const SharedFolder folder;
  folder.AddFile("a");
  folder.AddFile(".hidden");
  WriteFile(folder.Beside("secret"), "secret");
  const SharedTree tree = folder.Tree();
  const auto root = tree.Find({});
  ASSERT_TRUE(root);
  for (const std::string name : {"nothing", "..", ".", "", "../secret", ".hidden", "/etc/passwd"}) {
    EXPECT_FALSE(MakeZip(tree, *root, {"a", name})) << name;
  }
}

TEST(ShareZip, IsNotMadeOfAFile) {
  const SharedFolder folder;
  folder.AddFile("a");
  const SharedTree tree = folder.Tree();
  EXPECT_FALSE(MakeZip(tree, *tree.Find({"a"}), {}));
}

// --- What the archive tells ---------------------------------------------------------------------

TEST(ShareZip, TellsNothingOfOwnersAndModes) {
  const SharedFolder folder;
  folder.AddFile("a");
  chmod(folder.File("a").c_str(), 0600);
  folder.AddFolder("b");
  chmod(folder.File("b").c_str(), 0700);
  const Unpacked archive(ZipOf(folder));
  EXPECT_EQ(archive.Tell("oct(e.external_attr >> 16)"), "0o100644\n0o40755\n");
  // A field 0x7875 has version 1, then the ids, each with its width.
  const std::string ids = archive.Tell("e.extra[e.extra.index(b'ux'):].hex()[8:]");
  EXPECT_THAT(ids, testing::StartsWith("0104000000000400000000"));
  EXPECT_EQ(ids.substr(ids.find('\n') + 1), ids.substr(0, ids.find('\n') + 1));
}

TEST(ShareZip, TellsWhenAFileHasChanged) {
  const SharedFolder folder;
  folder.AddFile("a");
  const timespec times[2] = {{1'600'000'000, 0}, {1'600'000'000, 0}};
  utimensat(AT_FDCWD, folder.File("a").c_str(), times, 0);
  // A field 0x5455 has its flags, then seconds since the Unix epoch.
  EXPECT_EQ(Unpacked(ZipOf(folder))
                .Tell("int.from_bytes(e.extra[e.extra.index(b'UT') + 5:][:4], 'little')"),
            "1600000000\n");
}

TEST(ShareZip, HasNamesInUtf8AndSaysSo) {
  const SharedFolder folder;
  folder.AddFile("Größe €.txt");
  const Unpacked archive(ZipOf(folder));
  EXPECT_EQ(archive.Names(), "Größe €.txt\n");
  EXPECT_EQ(archive.Tell("bool(e.flag_bits & 0x800)"), "True\n");
}

TEST(ShareZip, TakesBrokenNamesForLatin1) {
  const SharedFolder folder;
  folder.AddFile(
      "Gr\xF6\xDF"
      "e");
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "Größe\n");
}

TEST(ShareZip, HasNoNameThatLeadsOutWhereItIsUnpacked) {
  const SharedFolder folder;
  folder.AddFile("a\\..\\..\\b");
  folder.AddFile("c\nd");
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "a_.._.._b\nc_d\n");
}

TEST(ShareZip, CompressesWhatIsNotCompressedYet) {
  const SharedFolder folder;
  folder.AddFile("a.txt", std::string(10'000, 'a'));
  folder.AddFile("b.jpg", std::string(10'000, 'a'));
  EXPECT_EQ(Unpacked(ZipOf(folder)).Tell("e.compress_type, e.compress_size < 1000"),
            "8 True\n0 False\n");
}

// --- What is left out ---------------------------------------------------------------------------

TEST(ShareZip, LeavesOutWhatAListingDoesNotShow) {
  const SharedFolder folder;
  folder.AddFile("a");
  folder.AddFile(".hidden");
  folder.AddFolder(".git");
  folder.AddFile(".git/config");
  ASSERT_EQ(mkfifo(folder.File("pipe").c_str(), 0666), 0);
  folder.AddLink("out", "/etc/passwd");
  folder.AddLink("up", "..");
  folder.AddLink("dangling", "nothing");
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "a\n");
}

TEST(ShareZip, HoldsWhatALinkLeadsTo) {
  const SharedFolder folder;
  folder.AddFile("a", "hello");
  folder.AddLink("link", "a");
  const Unpacked archive(ZipOf(folder));
  EXPECT_EQ(archive.ContentOf("link"), "hello");
  EXPECT_EQ(archive.Tell("oct(e.external_attr >> 16)"), "0o100644\n0o100644\n");
}

TEST(ShareZip, DoesNotGoRoundInCircles) {
  const SharedFolder folder;
  folder.AddFolder("sub");
  folder.AddFile("sub/a");
  folder.AddLink("sub/again", "..");
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "sub/\nsub/a\n");
}

TEST(ShareZip, FollowsALinkToAFolderThatIsSelected) {
  const SharedFolder folder;
  folder.AddFolder("sub");
  folder.AddFile("sub/a");
  folder.AddLink("link", "sub");
  EXPECT_EQ(Unpacked(ZipOf(folder, {"link"})).Names(), "link/\nlink/a\n");
}

TEST(ShareZip, LeavesOutWhatItsOwnerMayNotReadAndNotesIt) {
  const SharedFolder folder;
  folder.AddFile("a");
  folder.AddFile("secret");
  chmod(folder.File("secret").c_str(), 0);
  const LogCapture log;
  EXPECT_EQ(Unpacked(ZipOf(folder)).Names(), "a\n");
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("goes without “secret”")));
}

TEST(ShareZip, LeavesOutWhatVanishesMeanwhile) {
  const SharedFolder folder;
  folder.AddFile("a");
  folder.AddFile("b");
  Response response = ZipOf(folder, {"a", "b"});
  ASSERT_EQ(unlink(folder.File("b").c_str()), 0);
  const LogCapture log;
  EXPECT_EQ(Unpacked(std::move(response)).Names(), "a\n");
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("goes without “b”")));
}

// --- Files that change meanwhile ----------------------------------------------------------------

/// A large file whose archive is read to somewhere in its middle.
class ShareZipMeanwhile : public testing::Test {
 protected:
  static constexpr size_t kSize = 1'000'000;

  ShareZipMeanwhile() {
    folder_.AddFile("large.bin", Noise(kSize));
    response_.emplace(ZipOf(folder_));
    std::string buffer(200'000, '\0');
    while (begun_.size() < 200'000) {
      const ssize_t count = BodyOf(*response_).Read(buffer.data(), 200'000 - begun_.size());
      begun_.append(buffer, 0, static_cast<size_t>(count));
    }
  }

  // The size and the sum that another program finds.
  std::string Finish() {
    EXPECT_TRUE(ReadAll(BodyOf(*response_), begun_));
    const TempDir folder;
    WriteFile(folder.File("archive.zip"), begun_);
    const auto outcome = RunProgram({"python3", "-c",
                                     "import sys, zipfile\n"
                                     "archive = zipfile.ZipFile(sys.argv[1])\n"
                                     "print(archive.testzip(), archive.infolist()[0].file_size)",
                                     folder.File("archive.zip")});
    EXPECT_EQ(outcome.status, 0) << outcome.err;
    return outcome.out;
  }

  SharedFolder folder_;
  std::optional<Response> response_;
  std::string begun_;
};

TEST_F(ShareZipMeanwhile, AFileThatGrowsIsCut) {
  ASSERT_EQ(truncate(folder_.File("large.bin").c_str(), 2 * kSize), 0);
  EXPECT_EQ(Finish(), "None 1000000\n");
}

TEST_F(ShareZipMeanwhile, AFileThatShrinksIsAsLongAsItIs) {
  ASSERT_EQ(truncate(folder_.File("large.bin").c_str(), kSize / 2), 0);
  EXPECT_EQ(Finish(), "None 500000\n");
}

TEST_F(ShareZipMeanwhile, AFileThatIsRemovedIsInAllTheSame) {
  ASSERT_EQ(unlink(folder_.File("large.bin").c_str()), 0);
  EXPECT_EQ(Finish(), "None 1000000\n");
}

TEST_F(ShareZipMeanwhile, NothingStaysOpenOfAnArchiveThatIsNotReadToItsEnd) {
  const auto open_files = [] {
    return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                         std::filesystem::directory_iterator());
  };
  const auto before = open_files();
  response_.reset();
  // The tree, the folder and the file in it.
  EXPECT_EQ(before - open_files(), 3);
}

// --- Limits -------------------------------------------------------------------------------------

TEST(ShareZip, BreaksOffWhereAFolderIsTooDeep) {
  const SharedFolder folder;
  std::string name = "d";
  for (size_t depth = 0; depth < kMaxZipDepth; ++depth, name += "/d") folder.AddFolder(name);
  const LogCapture log;
  Response response = ZipOf(folder);
  std::string content;
  EXPECT_FALSE(ReadAll(BodyOf(response), content));
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("too deep")));
}

TEST(ShareZip, TakesAFolderThatIsAlmostTooDeep) {
  const SharedFolder folder;
  std::string name = "d";
  for (size_t depth = 1; depth < kMaxZipDepth; ++depth, name += "/d") folder.AddFolder(name);
  Response response = ZipOf(folder);
  std::string content;
  EXPECT_TRUE(ReadAll(BodyOf(response), content));
}

TEST(ShareZip, GoesThroughNoMoreEntriesThanItMay) {
  const SharedFolder folder;
  for (const std::string name : {"1", "2", "3", "4"}) folder.AddFile(name);
  const LogCapture log;
  ZipWalk walk(folder.Tree(), {}, {}, 3);
  size_t entries = 0;
  while (walk.Next()) ++entries;
  EXPECT_EQ(entries, 3u);
  EXPECT_TRUE(walk.HasFailed());
  EXPECT_THAT(log.Texts(), ElementsAre(HasSubstr("too many entries")));
}

TEST(ShareZip, GoesThroughAsManyEntriesAsItMay) {
  const SharedFolder folder;
  for (const std::string name : {"1", "2", "3"}) folder.AddFile(name);
  ZipWalk walk(folder.Tree(), {}, {}, 3);
  while (walk.Next()) continue;
  EXPECT_FALSE(walk.HasFailed());
}

TEST(ShareZip, LeavesNothingOfItsWorkInTheThread) {
  const SharedFolder folder;
  folder.AddFile("a");
  const locale_t before = uselocale(nullptr);
  Unpacked archive(ZipOf(folder));
  EXPECT_EQ(uselocale(nullptr), before);
}

}  // namespace
