#include "velk/velkrandom.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cctype>
#include <climits>
#include <cmath>
#include <cstdint>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace {

using VELK::RANDOM::POOL_ALPHA_NUMERIC;
using VELK::RANDOM::POOL_URL_FRIENDLY;
using VELK::RANDOM::VELKRandom;
using VELK::RANDOM::VELKRandomBase;

/// Whether equally likely outcomes would be counted like this. A fair source is taken for an
/// unfair one once in 10^13 times.
bool LooksUniform(const std::vector<size_t> &counts) {
  double total = 0;
  for (const size_t count : counts) total += static_cast<double>(count);
  const double expected = total / static_cast<double>(counts.size());
  double chi_square = 0;
  for (const size_t count : counts) {
    chi_square += std::pow(static_cast<double>(count) - expected, 2) / expected;
  }
  const double freedom = static_cast<double>(counts.size() - 1);
  const double rarity = 30;  // the tail beyond the bound is less than e^-rarity
  return chi_square < freedom + 2 * std::sqrt(freedom * rarity) + 2 * rarity;
}

std::vector<size_t> CountsOf(const std::string &text, const std::string &pool) {
  std::vector<size_t> of_byte(256);
  for (const unsigned char byte : text) ++of_byte[byte];
  std::vector<size_t> counts;
  for (const unsigned char byte : pool) counts.push_back(of_byte[byte]);
  return counts;
}

std::string AllBytes() {
  std::string bytes;
  for (int value = 0; value < 256; ++value) bytes.push_back(static_cast<char>(value));
  return bytes;
}

TEST(VelkRandomPools, AlphaNumericIsTheLettersAndDigitsOnceEach) {
  const std::string pool = POOL_ALPHA_NUMERIC;
  EXPECT_EQ(pool.size(), 62U);
  EXPECT_EQ(std::set<char>(pool.begin(), pool.end()).size(), 62U);
  for (const char c : pool) EXPECT_TRUE(isascii(c) && isalnum(c)) << c;
}

TEST(VelkRandomPools, UrlFriendlyAddsHyphenAndUnderscore) {
  const std::string pool = POOL_URL_FRIENDLY;
  const std::string letters_and_digits = POOL_ALPHA_NUMERIC;
  std::set<char> expected(letters_and_digits.begin(), letters_and_digits.end());
  expected.insert({'-', '_'});
  EXPECT_EQ(pool.size(), 64U);
  EXPECT_EQ(std::set<char>(pool.begin(), pool.end()), expected);
}

TEST(VelkRandomNumber, StaysInTheRangeAndReachesBothEnds) {
  VELKRandomBase source;
  std::set<int> seen;
  for (int i = 0; i < 1000; ++i) seen.insert(source.random(-2, 2));
  EXPECT_EQ(seen, (std::set<int>{-2, -1, 0, 1, 2}));
}

TEST(VelkRandomNumber, IsTheOnlyOneOfARangeOfOne) {
  VELKRandomBase source;
  for (const int only : {0, 7, -7, INT_MIN, INT_MAX}) EXPECT_EQ(source.random(only, only), only);
}

TEST(VelkRandomNumber, ThrowsForARangeUpsideDown) {
  VELKRandomBase source;
  EXPECT_THROW(source.random(1, 0), std::invalid_argument);
  EXPECT_THROW(source.random(INT_MAX, INT_MIN), std::invalid_argument);
}

TEST(VelkRandomNumber, IsUniformInAPercentage) {
  VELKRandomBase source;
  std::vector<size_t> counts(100);
  for (int i = 0; i < 100000; ++i) ++counts[static_cast<size_t>(source.random(0, 99))];
  EXPECT_TRUE(LooksUniform(counts));
}

TEST(VelkRandomNumber, IsUniformOverAllNumbers) {
  VELKRandomBase source;
  std::vector<size_t> counts(16);
  for (int i = 0; i < 100000; ++i) {
    const uint32_t word = static_cast<uint32_t>(source.random(INT_MIN, INT_MAX));
    ++counts[word >> 28];
  }
  EXPECT_TRUE(LooksUniform(counts));
}

TEST(VelkRandomNumber, FavoursNoPartOfARangeThatDoesNotDivideTheWord) {
  // Three quarters of all words: a plain remainder would give the first third twice as often.
  constexpr int64_t kThird = int64_t{1} << 30;
  VELKRandomBase source;
  std::vector<size_t> counts(3);
  for (int i = 0; i < 60000; ++i) {
    const int64_t drawn = source.random(INT_MIN, static_cast<int>(INT_MIN + 3 * kThird - 1));
    ++counts[static_cast<size_t>((drawn - INT_MIN) / kThird)];
  }
  EXPECT_TRUE(LooksUniform(counts));
}

TEST(VelkRandomText, HasTheLengthAskedFor) {
  VELKRandom source;
  for (const unsigned int length : {1U, 9U, 15U, 16U, 32U, 59U, 255U, 256U, 257U, 1000000U}) {
    std::string text = "what was there before";
    ASSERT_TRUE(source.getString(POOL_ALPHA_NUMERIC, length, text));
    EXPECT_EQ(text.size(), length);
  }
}

TEST(VelkRandomText, IsEmptyForLengthNothing) {
  VELKRandom source;
  std::string text = "what was there before";
  EXPECT_TRUE(source.getString(POOL_ALPHA_NUMERIC, 0, text));
  EXPECT_EQ(text, "");
}

TEST(VelkRandomText, OfAPoolOfOneIsThatByte) {
  VELKRandom source;
  std::string text;
  ASSERT_TRUE(source.getString("x", 300, text));
  EXPECT_EQ(text, std::string(300, 'x'));
}

TEST(VelkRandomText, IsUniformForPoolsOfEverySize) {
  VELKRandom source;
  for (const size_t size : {2U, 62U, 64U, 100U, 129U, 255U, 256U}) {
    const std::string pool = AllBytes().substr(0, size);
    std::string text;
    ASSERT_TRUE(source.getString(pool, 1000000, text));
    const std::vector<size_t> counts = CountsOf(text, pool);
    size_t total = 0;
    for (const size_t count : counts) total += count;
    EXPECT_EQ(total, text.size()) << "a byte from outside a pool of " << size;
    EXPECT_TRUE(LooksUniform(counts)) << "pool of " << size;
  }
}

TEST(VelkRandomText, TakesAByteTwiceAsOftenThatStandsTwiceInThePool) {
  VELKRandom source;
  std::string text;
  ASSERT_TRUE(source.getString("aab", 300000, text));
  const std::vector<size_t> counts = CountsOf(text, "ab");
  EXPECT_TRUE(LooksUniform({counts[0] / 2, counts[0] - counts[0] / 2, counts[1]}));
}

TEST(VelkRandomText, RefusesAnEmptyPool) {
  VELKRandom source;
  for (const unsigned int length : {0U, 9U}) {
    std::string text = "what was there before";
    EXPECT_FALSE(source.getString("", length, text));
    EXPECT_EQ(text, "");
  }
}

TEST(VelkRandomText, RefusesAPoolOfMoreThan256Bytes) {
  VELKRandom source;
  std::string text = "what was there before";
  EXPECT_FALSE(source.getString(AllBytes() + "x", 9, text));
  EXPECT_EQ(text, "");
}

TEST(VelkRandomText, MayReplaceItsOwnPool) {
  VELKRandom source;
  std::string text = "ab";
  ASSERT_TRUE(source.getString(text, 100, text));
  EXPECT_EQ(text.size(), 100U);
  EXPECT_EQ(text.find_first_not_of("ab"), std::string::npos);
}

TEST(VelkRandomText, DoesNotRepeatItself) {
  VELKRandom source;
  std::set<std::string> seen;
  for (int i = 0; i < 10000; ++i) {
    std::string text;
    ASSERT_TRUE(source.getString(POOL_URL_FRIENDLY, 32, text));
    seen.insert(text);
  }
  EXPECT_EQ(seen.size(), 10000U);
}

TEST(VelkRandomText, MayBeDrawnByManyThreadsAtOnce) {
  VELKRandom source;
  std::vector<std::string> texts(8);
  std::vector<std::thread> threads;
  for (std::string &text : texts) {
    threads.emplace_back([&] {
      for (int i = 0; i < 1000; ++i) source.getString(POOL_ALPHA_NUMERIC, 32, text);
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_THAT(texts, testing::Each(testing::SizeIs(32)));
  EXPECT_EQ(std::set<std::string>(texts.begin(), texts.end()).size(), texts.size());
}

}  // namespace
