#include <gtest/gtest.h>
#include <velksharing/utils.h>

#include <climits>
#include <string>

namespace {

using VELK::sharing::ToString;

template <typename T>
std::string TextOf(T value) {
  return ToString<T>(value);
}

template <typename T>
std::string TextOfConst(T value) {
  return ToString<const T>(value);
}

TEST(ToString, GivesAStringAsItIs) {
  const std::string text("it's\0 \xff", 8);
  EXPECT_EQ(text, TextOf<std::string>(text));
  EXPECT_EQ("", TextOf<std::string>(""));
}

TEST(ToString, GivesOneAndZeroForTruth) {
  EXPECT_EQ("1", TextOf<bool>(true));
  EXPECT_EQ("0", TextOf<bool>(false));
  EXPECT_EQ("1", TextOfConst<bool>(true));
  EXPECT_EQ("0", TextOfConst<bool>(false));
}

TEST(ToString, GivesNumbersInPlainDecimal) {
  for (const int number : {0, -1, 7, 1000000, INT_MAX, INT_MIN}) {
    EXPECT_EQ(std::to_string(number), TextOf<int>(number));
    EXPECT_EQ(std::to_string(number), TextOfConst<int>(number));
    EXPECT_EQ(std::to_string(number), TextOfConst<long>(number));
  }
  EXPECT_EQ("2147483647", TextOfConst<int>(INT_MAX));
  EXPECT_EQ("0", TextOfConst<long>(0));
  EXPECT_EQ(std::to_string(LONG_MAX), TextOfConst<long>(LONG_MAX));
}

}  // namespace
