#include "velk/velkwins.h"

#include <gtest/gtest.h>

#include <string>

namespace {

constexpr char kUntouched[] = "what was there before";

/// Expects that `name` is not converted and that the caller's buffer stays as it was.
void ExpectNotConverted(const char *name) {
  char out[493] = "";
  std::string(kUntouched).copy(out, sizeof(out));
  EXPECT_EQ(VELKWinsUserNameFqdn2Netbios(name, out, sizeof(out)), 0);
  EXPECT_STREQ(out, kUntouched);
}

TEST(VelkWins, ConvertsNoDomainThatNobodyKnows) {
  ExpectNotConverted("no-such-realm.invalid\\alice");
}

TEST(VelkWins, ConvertsNoNameWithoutADomain) {
  ExpectNotConverted("alice");
  ExpectNotConverted("\\alice");
  ExpectNotConverted("alice@no-such-realm.invalid");
}

TEST(VelkWins, ConvertsNoNameWithoutAnAccount) {
  ExpectNotConverted("no-such-realm.invalid\\");
  ExpectNotConverted("\\");
}

TEST(VelkWins, ConvertsNeitherNullNorNothing) {
  ExpectNotConverted(nullptr);
  ExpectNotConverted("");
}

TEST(VelkWins, ConvertsNoHugeName) {
  ExpectNotConverted((std::string(1000000, 'r') + "\\alice").c_str());
}

TEST(VelkWins, ConvertsNoNameThatIsNotUtf8) {
  ExpectNotConverted("\xff\xfe\\\x80");
}

TEST(VelkWins, WritesNothingWithoutABuffer) {
  EXPECT_EQ(VELKWinsUserNameFqdn2Netbios("no-such-realm.invalid\\alice", nullptr, 493), 0);
}

TEST(VelkWins, WritesNothingIntoATinyBuffer) {
  for (size_t capacity = 0; capacity < 4; ++capacity) {
    char out[] = "abcd";
    EXPECT_EQ(VELKWinsUserNameFqdn2Netbios("no-such-realm.invalid\\alice", out, capacity), 0);
    EXPECT_STREQ(out, "abcd");
  }
}

}  // namespace
