#include "share/listing.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <ostream>
#include <string>
#include <vector>

#include "share/natural_order.h"
#include "share_support.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using web::share::CompareNaturally;
using web::share::Entry;
using web::share::kMaxListed;
using web::share::Listing;
using web::share::Order;
using web::share::PreviewKind;
using web::share::ReadListing;
using web::share::SharedTree;
using web::share::SortBy;
using web_test::SharedFolder;

using Parts = std::vector<std::string>;

Listing List(const SharedFolder &folder, Order order = {}, const Parts &parts = {}) {
  const SharedTree tree = folder.Tree();
  return ReadListing(tree, tree.Find(parts).value(), order).value();
}

Parts Names(const Listing &listing) {
  Parts names;
  for (const Entry &entry : listing.entries) names.push_back(entry.name);
  return names;
}

void SetTime(const std::string &path, time_t seconds) {
  const timespec times[2] = {{seconds, 0}, {seconds, 0}};
  ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

TEST(ShareListing, TellsWhatAFileIs) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "hello");
  SetTime(folder.File("a.txt"), 1'600'000'000);
  const Listing listing = List(folder);
  ASSERT_EQ(listing.entries.size(), 1u);
  const Entry &entry = listing.entries[0];
  EXPECT_EQ(entry.name, "a.txt");
  EXPECT_FALSE(entry.is_folder);
  EXPECT_EQ(entry.size, 5);
  EXPECT_EQ(entry.changed, 1'600'000'000);
  EXPECT_EQ(entry.preview, PreviewKind::TEXT);
  EXPECT_FALSE(entry.has_thumbnail);
}

TEST(ShareListing, AFolderHasNoSizeAndNoPreview) {
  const SharedFolder folder;
  folder.AddFolder("pictures.png");
  const Listing listing = List(folder);
  ASSERT_EQ(listing.entries.size(), 1u);
  EXPECT_TRUE(listing.entries[0].is_folder);
  EXPECT_EQ(listing.entries[0].size, 0);
  EXPECT_EQ(listing.entries[0].preview, PreviewKind::OTHER);
  EXPECT_FALSE(listing.entries[0].has_thumbnail);
}

TEST(ShareListing, AnImageHasAThumbnailUnlessItIsEmpty) {
  const SharedFolder folder;
  folder.AddFile("1.jpg");
  folder.AddFile("2.jpg", "");
  const Listing listing = List(folder);
  EXPECT_TRUE(listing.entries[0].has_thumbnail);
  EXPECT_FALSE(listing.entries[1].has_thumbnail);
}

TEST(ShareListing, AnEmptyFolderHasNoEntries) {
  const SharedFolder folder;
  const Listing listing = List(folder);
  EXPECT_THAT(listing.entries, IsEmpty());
  EXPECT_EQ(listing.left_out, 0u);
}

TEST(ShareListing, ReadsAFolderInAFolder) {
  const SharedFolder folder;
  folder.AddFolder("sub");
  folder.AddFile("sub/a");
  EXPECT_THAT(Names(List(folder, {}, {"sub"})), ElementsAre("a"));
}

TEST(ShareListing, ReadsTheSameItemTwice) {
  const SharedFolder folder;
  folder.AddFile("a");
  const SharedTree tree = folder.Tree();
  const auto item = tree.Find({});
  ASSERT_TRUE(item);
  ReadListing(tree, *item, {});
  EXPECT_THAT(Names(*ReadListing(tree, *item, {})), ElementsAre("a"));
}

TEST(ShareListing, AFileHasNone) {
  const SharedFolder folder;
  folder.AddFile("a");
  const SharedTree tree = folder.Tree();
  EXPECT_FALSE(ReadListing(tree, *tree.Find({"a"}), {}));
}

TEST(ShareListing, AFolderThatItsOwnerMayNoLongerReadHasNone) {
  const SharedFolder folder;
  folder.AddFolder("sub");
  const SharedTree tree = folder.Tree();
  const auto item = tree.Find({"sub"});
  ASSERT_TRUE(item);
  chmod(folder.File("sub").c_str(), 0);
  EXPECT_FALSE(ReadListing(tree, *item, {}));
  chmod(folder.File("sub").c_str(), 0755);  // or it could not be removed
}

TEST(ShareListing, LeavesOutWhatIsNeitherFileNorFolder) {
  const SharedFolder folder;
  folder.AddFile("a");
  ASSERT_EQ(mkfifo(folder.File("pipe").c_str(), 0666), 0);
  EXPECT_THAT(Names(List(folder)), ElementsAre("a"));
}

TEST(ShareListing, LeavesOutWhatIsHidden) {
  const SharedFolder folder;
  folder.AddFile(".hidden");
  folder.AddFile("..also");
  folder.AddFolder(".git");
  EXPECT_THAT(Names(List(folder)), IsEmpty());
}

TEST(ShareListing, ShowsALinkAsWhatItLeadsTo) {
  const SharedFolder folder;
  folder.AddFile("a", "12345");
  folder.AddFolder("b");
  folder.AddLink("to_a", "a");
  folder.AddLink("to_b", "b");
  const Listing listing = List(folder);
  EXPECT_THAT(Names(listing), ElementsAre("b", "to_b", "a", "to_a"));
  EXPECT_TRUE(listing.entries[1].is_folder);
  EXPECT_EQ(listing.entries[3].size, 5);
}

TEST(ShareListing, LeavesOutLinksThatLeadNowhereOrOut) {
  const SharedFolder folder;
  folder.AddLink("dangling", "nothing");
  folder.AddLink("loop", "loop");
  folder.AddLink("up", "..");
  folder.AddLink("absolute", "/etc/passwd");
  folder.AddLink("device", "/dev/null");
  EXPECT_THAT(Names(List(folder)), IsEmpty());
}

TEST(ShareListing, KeepsNamesThatAreNotUtf8) {
  const SharedFolder folder;
  folder.AddFile("br\xF6ken");
  folder.AddFile("a\nb");
  EXPECT_THAT(Names(List(folder)), UnorderedElementsAre("br\xF6ken", "a\nb"));
}

/// A folder and three files whose orders differ.
class ShareListingOrder : public testing::Test {
 protected:
  ShareListingOrder() {
    Add("b", "1", 300);
    Add("A", "333", 200);
    Add("c", "22", 100);
    folder_.AddFolder("z");
  }

  void Add(const std::string &name, const std::string &content, time_t changed) {
    folder_.AddFile(name, content);
    SetTime(folder_.File(name), changed);
  }
  Parts By(SortBy by, bool is_descending) const {
    return Names(List(folder_, {by, is_descending}));
  }

  SharedFolder folder_;
};

TEST_F(ShareListingOrder, ByNameAscending) {
  EXPECT_THAT(By(SortBy::NAME, false), ElementsAre("z", "A", "b", "c"));
}
TEST_F(ShareListingOrder, ByNameDescending) {
  EXPECT_THAT(By(SortBy::NAME, true), ElementsAre("z", "c", "b", "A"));
}
TEST_F(ShareListingOrder, BySizeAscending) {
  EXPECT_THAT(By(SortBy::SIZE, false), ElementsAre("z", "b", "c", "A"));
}
TEST_F(ShareListingOrder, BySizeDescending) {
  EXPECT_THAT(By(SortBy::SIZE, true), ElementsAre("z", "A", "c", "b"));
}
TEST_F(ShareListingOrder, ByDateAscending) {
  EXPECT_THAT(By(SortBy::DATE, false), ElementsAre("z", "c", "A", "b"));
}
TEST_F(ShareListingOrder, ByDateDescending) {
  EXPECT_THAT(By(SortBy::DATE, true), ElementsAre("z", "b", "A", "c"));
}
TEST_F(ShareListingOrder, EqualSizesGoByName) {
  Add("a2", "22", 1);
  EXPECT_THAT(By(SortBy::SIZE, false), ElementsAre("z", "b", "a2", "c", "A"));
}

TEST(ShareListing, ShowsTheFirstOfManyAndCountsTheRest) {
  const SharedFolder folder;
  constexpr size_t kMany = 2 * kMaxListed + 17;
  for (size_t number = 0; number < kMany; ++number) {
    velk_test::WriteFile(folder.File("f" + std::to_string(number)), "");
  }
  folder.AddFolder("zzz");
  const Listing listing = List(folder);
  EXPECT_EQ(listing.entries.size(), kMaxListed);
  EXPECT_EQ(listing.left_out, kMany + 1 - kMaxListed);
  EXPECT_EQ(listing.entries.front().name, "zzz");
  EXPECT_EQ(listing.entries[1].name, "f0");
  EXPECT_EQ(listing.entries.back().name, "f" + std::to_string(kMaxListed - 2));
}

struct NaturalCase {
  std::string smaller;
  std::string larger;
};

void PrintTo(const NaturalCase &test_case, std::ostream *out) {
  *out << test_case.smaller << " before " << test_case.larger;
}

class NaturalOrder : public testing::TestWithParam<NaturalCase> {};

TEST_P(NaturalOrder, PutsTheSmallerFirst) {
  EXPECT_LT(CompareNaturally(GetParam().smaller, GetParam().larger), 0);
  EXPECT_GT(CompareNaturally(GetParam().larger, GetParam().smaller), 0);
}

INSTANTIATE_TEST_SUITE_P(
    ShareListing, NaturalOrder,
    testing::Values(NaturalCase{"page 9", "page 10"}, NaturalCase{"a", "B"}, NaturalCase{"A", "b"},
                    NaturalCase{"", "a"}, NaturalCase{"a", "aa"}, NaturalCase{"1", "a"},
                    NaturalCase{"2", "10"}, NaturalCase{"0", "1"}, NaturalCase{"007", "8"},
                    NaturalCase{"1.9", "1.10"}, NaturalCase{"A", "a"}, NaturalCase{"07", "7"},
                    NaturalCase{"x99999999999999999998", "x99999999999999999999"},
                    NaturalCase{"x9", "x99999999999999999999999"}, NaturalCase{"z", "\xC3\xA4"},
                    NaturalCase{"img12a", "img12b"}, NaturalCase{"00", "000"}));

TEST(NaturalOrder, AnyNameEqualsOnlyItself) {
  EXPECT_EQ(CompareNaturally("a1", "a1"), 0);
  EXPECT_NE(CompareNaturally("a1", "A1"), 0);
  EXPECT_NE(CompareNaturally("a1", "a01"), 0);
}

}  // namespace
