#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <velksharing/utils.h>

#include <cmath>
#include <string>
#include <vector>

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using VELK::sharing::IsProbabilityHit;
using VELK::sharing::StringExplode;

std::vector<std::string> Pieces(const std::string &text, const char *delimiter) {
  std::vector<std::string> pieces = {"before"};
  EXPECT_TRUE(StringExplode(pieces, text, delimiter));
  return pieces;
}

int Hits(float probability, int draws) {
  int hits = 0;
  for (int draw = 0; draw < draws; ++draw) hits += IsProbabilityHit(probability) ? 1 : 0;
  return hits;
}

TEST(StringExplode, DropsEmptyPieces) {
  EXPECT_THAT(Pieces(",a,,b,", ","), ElementsAre("a", "b"));
  EXPECT_THAT(Pieces(",,,", ","), IsEmpty());
}

TEST(StringExplode, GivesNoPieceOfAnEmptyText) {
  EXPECT_THAT(Pieces("", ","), IsEmpty());
}

TEST(StringExplode, GivesTheWholeTextWithoutADelimiterInIt) {
  EXPECT_THAT(Pieces("a;b", ","), ElementsAre("a;b"));
}

TEST(StringExplode, LooksForTheWholeDelimiter) {
  EXPECT_THAT(Pieces("a;;b", ";;"), ElementsAre("a", "b"));
  EXPECT_THAT(Pieces("a;b;;c", ";;"), ElementsAre("a;b", "c"));
  EXPECT_THAT(Pieces("a;;;b", ";;"), ElementsAre("a", ";b"));
}

TEST(StringExplode, DoesNotTrim) {
  EXPECT_THAT(Pieces(" a , , b\t", ","), ElementsAre(" a ", " ", " b\t"));
}

TEST(StringExplode, KeepsZeroBytes) {
  EXPECT_THAT(Pieces(std::string("a\0,b", 4), ","), ElementsAre(std::string("a\0", 2), "b"));
}

TEST(StringExplode, SplitsTenMegabytes) {
  std::string text;
  for (size_t piece = 0; piece < (5u << 20); ++piece) text += "x,";
  EXPECT_EQ(5u << 20, Pieces(text, ",").size());
}

TEST(StringExplode, RefusesANullOrEmptyDelimiter) {
  std::vector<std::string> pieces = {"before"};
  EXPECT_FALSE(StringExplode(pieces, "a,b", nullptr));
  EXPECT_FALSE(StringExplode(pieces, "a,b", ""));
  EXPECT_THAT(pieces, ElementsAre("before"));
}

TEST(IsProbabilityHit, NeverHitsAtZero) {
  EXPECT_EQ(0, Hits(0.0f, 2000));
  EXPECT_EQ(0, Hits(-1.0f, 100));
}

TEST(IsProbabilityHit, AlwaysHitsAtOne) {
  EXPECT_EQ(2000, Hits(1.0f, 2000));
  EXPECT_EQ(100, Hits(2.0f, 100));
}

TEST(IsProbabilityHit, CutsDownToWholePercents) {
  EXPECT_EQ(0, Hits(0.009f, 2000));
}

TEST(IsProbabilityHit, HitsAboutAsOftenAsAsked) {
  const int hits = Hits(0.5f, 10000);
  EXPECT_GT(hits, 4500);  // ten standard deviations
  EXPECT_LT(hits, 5500);
}

TEST(IsProbabilityHit, NeverHitsForNoNumber) {
  EXPECT_EQ(0, Hits(std::nanf(""), 100));
}

}  // namespace
