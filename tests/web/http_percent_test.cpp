#include <gtest/gtest.h>

#include "http/percent.h"

namespace {

using web::PercentDecode;
using web::PercentEncode;

TEST(Percent, DecodesEscapesOfBothCases) {
  EXPECT_EQ("a b/ä", PercentDecode("a%20b%2f%C3%a4"));
}

TEST(Percent, LeavesAPlusSignAlone) {
  EXPECT_EQ("1+1", PercentDecode("1+1"));
}

TEST(Percent, DecodesOnce) {
  EXPECT_EQ("%2e", PercentDecode("%252e"));
}

TEST(Percent, GivesZeroBytes) {
  EXPECT_EQ(std::string("a\0b", 3), PercentDecode("a%00b"));
}

TEST(Percent, RefusesBrokenEscapes) {
  for (const char *broken : {"%", "%4", "a%", "%zz", "%4g", "%g4", "%%41", "% 41", "%u0041", "%-1"})
    EXPECT_EQ(std::nullopt, PercentDecode(broken)) << broken;
}

TEST(Percent, RefusesControlCharactersAndBlanksThatAreNotEscaped) {
  for (const char *raw : {"a b", "a\tb", "a\r\nb", "\x7f", "\x01"})
    EXPECT_EQ(std::nullopt, PercentDecode(raw)) << raw;
  EXPECT_EQ(std::nullopt, PercentDecode(std::string_view("a\0b", 3)));
}

TEST(Percent, EncodesWhateverHasAMeaning) {
  EXPECT_EQ("aZ9-._~", PercentEncode("aZ9-._~"));
  EXPECT_EQ("%2F%3F%23%25%20%26%3D%2B%0D%0A", PercentEncode("/?#% &=+\r\n"));
  EXPECT_EQ("%C3%A4%FF", PercentEncode("ä\xff"));
}

TEST(Percent, DecodesWhatItEncodes) {
  std::string every_byte;
  for (int byte = 0; byte < 256; ++byte) every_byte += static_cast<char>(byte);
  EXPECT_EQ(every_byte, PercentDecode(PercentEncode(every_byte)));
}

}  // namespace
