#include <gtest/gtest.h>

#include <string>

#include "velk/velksdk.h"

namespace {

using Conversion = int (*)(const char *ip, char *out, size_t capacity);

std::string Converted(Conversion convert, const char *ip) {
  char out[64] = "";
  return convert(ip, out, sizeof(out)) == 0 ? out : "(refused)";
}

std::string Normalized(const char *ip) {
  return Converted(VELKAddressNormalize, ip);
}

std::string Counted(const char *ip) {
  return Converted(VELKAutoBlockAddress, ip);
}

TEST(VelkSdkAddresses, AreSpelledInOneWay) {
  EXPECT_EQ("192.0.2.7", Normalized("192.0.2.7"));
  EXPECT_EQ("2001:db8::7", Normalized("2001:0DB8:0:0::0007"));
  EXPECT_EQ("192.0.2.7", Normalized("::ffff:192.0.2.7"));
  EXPECT_EQ("fe80::1", Normalized("fe80::1%eth0"));
}

TEST(VelkSdkAddresses, OtherTextsAreRefused) {
  for (const char *text : {"", "192.0.2", "192.0.2.7 ", "2001:db8::/64", "localhost", "::g"}) {
    EXPECT_EQ("(refused)", Normalized(text)) << text;
  }
  EXPECT_EQ("(refused)", Normalized(nullptr));
  EXPECT_EQ("(refused)", Counted(nullptr));
}

TEST(VelkSdkAddresses, OfVersionSixAreCountedByTheirNetwork) {
  EXPECT_EQ("192.0.2.7", Counted("::ffff:192.0.2.7"));
  EXPECT_EQ("2001:db8:0:1::/64", Counted("2001:db8:0:1:2:3:4:5"));
  EXPECT_EQ("2001:db8:0:1::/64", Counted("2001:db8:0:1::/64"));
  EXPECT_EQ("(refused)", Counted("192.0.2.0/24"));
}

TEST(VelkSdkAddresses, NeedRoomForTheirTerminator) {
  char out[9] = "before";
  EXPECT_EQ(-1, VELKAddressNormalize("192.0.2.7", out, sizeof(out)));
  EXPECT_STREQ("before", out);
  EXPECT_EQ(-1, VELKAddressNormalize("192.0.2.7", nullptr, 64));
  EXPECT_EQ(0, VELKAddressNormalize("10.0.0.7", out, sizeof(out)));
  EXPECT_STREQ("10.0.0.7", out);
}

}  // namespace
