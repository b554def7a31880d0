// The kernel's generator as it is on a bad day: this program has its own getrandom().

#include <gtest/gtest.h>
#include <sys/random.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <deque>
#include <string>
#include <system_error>
#include <vector>

#include "velk/velkrandom.h"

namespace {

using VELK::RANDOM::POOL_ALPHA_NUMERIC;
using VELK::RANDOM::POOL_URL_FRIENDLY;
using VELK::RANDOM::VELKRandom;
using VELK::RANDOM::VELKRandomBase;

/// What one call of getrandom() does.
struct Answer {
  int error = 0;           ///< Fails with this errno, unless 0.
  size_t most = SIZE_MAX;  ///< Gives no more bytes than these.
  unsigned char byte = 0;  ///< What they all are.
};

std::deque<Answer> answers;       // for the next calls; after them, plain ones
std::vector<size_t> sizes_asked;  // by every call so far

class VelkRandomFault : public testing::Test {
 protected:
  VelkRandomFault() {
    answers.clear();
    sizes_asked.clear();
  }

  static Answer Failing(int error) { return {error, 0, 0}; }
  static Answer Short(size_t most) { return {0, most, 0}; }
  static Answer Giving(unsigned char byte) { return {0, SIZE_MAX, byte}; }
};

TEST_F(VelkRandomFault, TextIsDrawnWhenSignalsInterrupt) {
  answers = {Failing(EINTR), Failing(EINTR), Failing(EINTR)};
  std::string text;
  EXPECT_TRUE(VELKRandom().getString("ab", 9, text));
  EXPECT_EQ(text, "aaaaaaaaa");
}

TEST_F(VelkRandomFault, TextIsDrawnFromShortAnswers) {
  answers = {Short(1), Short(2), Failing(EINTR), Short(3)};
  std::string text;
  EXPECT_TRUE(VELKRandom().getString("ab", 32, text));
  EXPECT_EQ(text, std::string(32, 'a'));
}

TEST_F(VelkRandomFault, TextIsEmptyWhenThereAreNoRandomBytes) {
  for (const int error : {ENOSYS, EAGAIN, EIO}) {
    answers = {Failing(error)};
    std::string text = "what was there before";
    EXPECT_FALSE(VELKRandom().getString("ab", 9, text));
    EXPECT_EQ(text, "");
  }
}

TEST_F(VelkRandomFault, TextIsEmptyWhenTheBytesEndHalfWay) {
  answers = {Giving(0), Giving(0), Short(5), Failing(ENOSYS)};
  std::string text = "what was there before";
  EXPECT_FALSE(VELKRandom().getString("ab", 1000, text));
  EXPECT_EQ(text, "");
}

TEST_F(VelkRandomFault, TextLeavesOutBytesThatWouldFavourTheBeginningOfThePool) {
  answers = {Giving(255), Giving(248), Giving(247)};  // 248 is the last multiple of 62
  std::string text;
  EXPECT_TRUE(VELKRandom().getString(POOL_ALPHA_NUMERIC, 5, text));
  EXPECT_EQ(text, std::string(5, POOL_ALPHA_NUMERIC[247 % 62]));
  EXPECT_EQ(sizes_asked.size(), 3U);
}

TEST_F(VelkRandomFault, TextOfAPoolThatDividesAByteLeavesNothingOut) {
  answers = {Giving(255)};
  std::string text;
  EXPECT_TRUE(VELKRandom().getString(POOL_URL_FRIENDLY, 5, text));
  EXPECT_EQ(text, std::string(5, POOL_URL_FRIENDLY[63]));
}

TEST_F(VelkRandomFault, AUsualTextTakesOneCall) {
  std::string text;
  for (unsigned int length = 9; length <= 32; ++length) {
    sizes_asked.clear();
    ASSERT_TRUE(VELKRandom().getString(POOL_ALPHA_NUMERIC, length, text));
    EXPECT_EQ(sizes_asked.size(), 1U);
  }
}

TEST_F(VelkRandomFault, NoCallAsksForMoreThanIsGivenInOnePiece) {
  std::string text;
  ASSERT_TRUE(VELKRandom().getString(POOL_ALPHA_NUMERIC, 100000, text));
  EXPECT_LE(*std::max_element(sizes_asked.begin(), sizes_asked.end()), 256U);
}

TEST_F(VelkRandomFault, NumberIsDrawnThroughInterruptionsAndShortAnswers) {
  answers = {Failing(EINTR), Short(1), Failing(EINTR), Short(2), Giving(0)};
  EXPECT_EQ(VELKRandomBase().random(5, 9), 5);
  EXPECT_EQ(sizes_asked, (std::vector<size_t>{4, 4, 3, 3, 1}));
}

TEST_F(VelkRandomFault, NumberLeavesOutWordsThatWouldFavourSmallOnes) {
  answers = {Giving(255), Giving(255), Giving(0)};  // 2^32 - 1 is the one word too many for thirds
  EXPECT_EQ(VELKRandomBase().random(1, 3), 1);
  EXPECT_EQ(sizes_asked.size(), 3U);
}

TEST_F(VelkRandomFault, NumberThrowsWhenThereAreNoRandomBytes) {
  answers = {Failing(ENOSYS)};
  try {
    VELKRandomBase().random(0, 99);
    FAIL() << "a number without random bytes";
  } catch (const std::system_error &error) {
    EXPECT_EQ(error.code(), std::errc::function_not_supported);
  }
}

}  // namespace

extern "C" __attribute__((visibility("default"))) ssize_t getrandom(void *out, size_t size,
                                                                    unsigned int /*flags*/) {
  sizes_asked.push_back(size);
  Answer answer;
  if (!answers.empty()) {
    answer = answers.front();
    answers.pop_front();
  }
  if (answer.error != 0) {
    errno = answer.error;
    return -1;
  }
  const size_t given = std::min(size, answer.most);
  memset(out, answer.byte, given);
  return static_cast<ssize_t>(given);
}
