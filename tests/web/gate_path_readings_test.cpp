#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "gate/path_readings.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::SizeIs;
using testing::UnorderedElementsAre;
using web::gate::kMostReadings;
using web::gate::OnlyReading;
using web::gate::ReadingsOf;

using Components = std::vector<std::string>;

/// The readings as components; one of the component "refused" when there are none.
std::vector<Components> Read(std::string_view path) {
  const auto readings = ReadingsOf(path);
  if (!readings) return {{"refused"}};
  std::vector<Components> all;
  for (const auto &reading : *readings) all.push_back(reading.components());
  return all;
}

TEST(GatePathReadings, APlainPathHasOne) {
  EXPECT_THAT(Read("/a/b.c/d"), ElementsAre(Components{"a", "b.c", "d"}));
  EXPECT_THAT(Read("/"), ElementsAre(Components{}));
}

TEST(GatePathReadings, EscapesThatBrowsersWriteMakeNoOther) {
  EXPECT_THAT(Read("/a%20b/%C3%A9/100%25"), ElementsAre(Components{"a b", "\xc3\xa9", "100%"}));
}

TEST(GatePathReadings, AnEscapeWithoutNeedMakesTwo) {
  EXPECT_THAT(Read("/a/%62"), ElementsAre(Components{"a", "%62"}, Components{"a", "b"}));
}

TEST(GatePathReadings, AnEscapedEscapeIsDecodedAsOftenAsItCanBe) {
  EXPECT_THAT(Read("/%2562"),
              UnorderedElementsAre(Components{"%2562"}, Components{"%62"}, Components{"b"}));
  EXPECT_THAT(Read("/%25%36%32"),
              UnorderedElementsAre(Components{"%%36%32"}, Components{"%62"}, Components{"b"}));
}

TEST(GatePathReadings, AnEncodedSlashIsALetterOrSeparates) {
  EXPECT_THAT(Read("/a%2Fb"), ElementsAre(Components{"a/b"}, Components{"a", "b"}));
}

TEST(GatePathReadings, ABackslashIsALetterOrSeparates) {
  EXPECT_THAT(Read("/a\\b"), ElementsAre(Components{"a\\b"}, Components{"a", "b"}));
}

TEST(GatePathReadings, AnEncodedBackslashIsNotTheSameAsABareOne) {
  EXPECT_THAT(Read("/a%5Cb"),
              ElementsAre(Components{"a%5Cb"}, Components{"a\\b"}, Components{"a", "b"}));
  EXPECT_THAT(Read("/a%5Cb\\..\\c"), Contains(Components{"c"}));
}

TEST(GatePathReadings, SlashesInARowAreKeptOrMerged) {
  EXPECT_THAT(Read("/a///b"), ElementsAre(Components{"a", "", "", "b"}, Components{"a", "b"}));
}

TEST(GatePathReadings, TwoSlashesAtTheFrontMayBeginAHost) {
  EXPECT_THAT(Read("//h/b"), UnorderedElementsAre(Components{"", "h", "b"}, Components{"h", "b"},
                                                  Components{"b"}));
  EXPECT_THAT(Read("//h"),
              UnorderedElementsAre(Components{"", "h"}, Components{"h"}, Components{}));
}

TEST(GatePathReadings, DotsAreKeptOrResolved) {
  EXPECT_THAT(Read("/a/./b"), ElementsAre(Components{"a", ".", "b"}, Components{"a", "b"}));
  EXPECT_THAT(Read("/a/../b"), ElementsAre(Components{"a", "..", "b"}, Components{"b"}));
  EXPECT_THAT(Read("/../../b"), ElementsAre(Components{"..", "..", "b"}, Components{"b"}));
}

TEST(GatePathReadings, DotsAreResolvedBeforeSlashesAreMergedAndAfter) {
  EXPECT_THAT(Read("/a//../b"),
              UnorderedElementsAre(Components{"a", "", "..", "b"}, Components{"a", "b"},
                                   Components{"b"}, Components{"a", "..", "b"}));
}

TEST(GatePathReadings, DotsAreResolvedBeforeEscapesAreDecodedAndAfter) {
  EXPECT_THAT(Read("/a/../b/%2e%2e/c"),
              UnorderedElementsAre(
                  Components{"a", "..", "b", "%2e%2e", "c"}, Components{"a", "..", "b", "..", "c"},
                  Components{"b", "%2e%2e", "c"}, Components{"b", "..", "c"}, Components{"c"}));
}

TEST(GatePathReadings, ParametersAreKeptOrGo) {
  EXPECT_THAT(Read("/a;x/b"),
              UnorderedElementsAre(Components{"a;x", "b"}, Components{"a", "b"}, Components{"a"}));
}

TEST(GatePathReadings, DotsMayAppearWhenParametersGo) {
  EXPECT_THAT(Read("/a/..;x/b"), Contains(Components{"b"}));
}

TEST(GatePathReadings, AnEncodedQuestionMarkOrNumberSignMayEndThePath) {
  for (const char *mark : {"%3F", "%3f", "%23"})
    EXPECT_THAT(Read(std::string("/a") + mark + "x/b"),
                UnorderedElementsAre(SizeIs(2), Components{"a"}))
        << mark;
}

TEST(GatePathReadings, TheFirstIsClosestToWhatWasSent) {
  EXPECT_EQ((Components{"", "%61;b", "..", "c/d"}), Read("//%61;b/../c%2Fd").front());
}

TEST(GatePathReadings, AreDistinct) {
  auto readings = Read("/a%2F..%2F/b;c");
  ASSERT_GT(readings.size(), 5u);
  std::sort(readings.begin(), readings.end());
  EXPECT_EQ(readings.end(), std::adjacent_find(readings.begin(), readings.end()));
}

TEST(GatePathReadings, TooManyAreRefused) {
  std::string path = "/%";
  for (size_t level = 1; level < kMostReadings - 1; ++level) path += "25";
  EXPECT_THAT(Read(path + "41"), SizeIs(kMostReadings));
  EXPECT_FALSE(ReadingsOf(path + "2541"));
}

TEST(GatePathReadings, ThereAreNoneOfWhatIsNoPath) {
  for (const char *path : {"", "a", "?", "/%", "/%4", "/%4g", "/a b", "/a\tb", "/\x7f", "/%00",
                           "/%0a", "/%7F", "/%2500", "/%C0%AF", "/%E0%80%AF", "/%25C0%25AF"})
    EXPECT_FALSE(ReadingsOf(path)) << path;
  EXPECT_FALSE(ReadingsOf(std::string_view("/\0", 2)));
}

TEST(GatePathReadings, TheOnlyOneDecodesEscapesWithoutNeed) {
  const auto reading = OnlyReading("/%70hotos/%63%61f%C3%A9/");
  ASSERT_TRUE(reading);
  EXPECT_THAT(reading->components(), ElementsAre("photos", "caf\xc3\xa9"));
}

TEST(GatePathReadings, ThereIsNoOnlyOneOfAPathWithAChoice) {
  for (const char *path : {"//", "/a//b", "/a//", "/.", "/a/..", "/%2e%2e", "/a%2Fb", "/a\\b",
                           "/a;b", "/a%3Bb", "/a%3F", "/a%23", "/%2561", "", "a", "/%zz"})
    EXPECT_FALSE(OnlyReading(path)) << path;
}

}  // namespace
