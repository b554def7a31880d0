#include <gtest/gtest.h>

#include "http/text.h"

namespace {

TEST(Text, IsTheSameInUpperAndLowerCase) {
  EXPECT_TRUE(web::IsSameText("Content-Type", "content-tYPE"));
  EXPECT_TRUE(web::IsSameText("", ""));
  EXPECT_FALSE(web::IsSameText("a", "ab"));
  EXPECT_FALSE(web::IsSameText("a", "b"));
}

TEST(Text, IsTrimmedAtItsEnds) {
  EXPECT_EQ("a b", web::Trimmed(" \ta b\t "));
  EXPECT_EQ("", web::Trimmed(" \t"));
  EXPECT_EQ("", web::Trimmed(""));
}

TEST(Text, IsTakenPartByPart) {
  std::string_view text = "a;;b";
  EXPECT_EQ("a", web::TakePart(text, ';'));
  EXPECT_EQ("", web::TakePart(text, ';'));
  EXPECT_EQ("b", web::TakePart(text, ';'));
  EXPECT_TRUE(text.empty());
  EXPECT_EQ("", web::TakePart(text, ';'));
}

TEST(Text, KnowsHexadecimalDigits) {
  EXPECT_EQ(0, web::HexDigitValue('0'));
  EXPECT_EQ(10, web::HexDigitValue('a'));
  EXPECT_EQ(15, web::HexDigitValue('F'));
  for (const char byte : {'g', 'G', '/', ':', '@', '`', '\0'})
    EXPECT_EQ(-1, web::HexDigitValue(byte)) << byte;
}

}  // namespace
