#include <gtest/gtest.h>
#include <velksharing/utils.h>

#include <string>

namespace {

using VELK::sharing::MD5HashPassword;
using VELK::sharing::Sha1WithSaltHashPassword;

std::string Sha1(const std::string &password, const std::string &salt) {
  std::string digest = "before";
  EXPECT_TRUE(Sha1WithSaltHashPassword(password, salt, digest));
  return digest;
}

std::string Md5(const std::string &password) {
  std::string digest = "before";
  EXPECT_TRUE(MD5HashPassword(password, digest));
  return digest;
}

TEST(Sha1WithSaltHashPassword, DigestsThePasswordFollowedByTheSalt) {
  EXPECT_EQ("c88e9c67041a74e0357befdff93f87dde0904214", Sha1("password", "salt"));
  EXPECT_EQ(Sha1("pass", "wordsalt"), Sha1("password", "salt"));
}

TEST(Sha1WithSaltHashPassword, DigestsEmptyTexts) {
  EXPECT_EQ("a0f1490a20d0211c997b44bc357e1972deab8ae3", Sha1("", "s"));
  EXPECT_EQ("da39a3ee5e6b4b0d3255bfef95601890afd80709", Sha1("", ""));
}

TEST(Sha1WithSaltHashPassword, DigestsZeroBytes) {
  EXPECT_EQ("cca3bf812ed18f01814c3fd345d4b5ae3c5f4278",
            Sha1(std::string("a\0b", 3), std::string("s\0t", 3)));
}

TEST(Sha1WithSaltHashPassword, TakesThePasswordItWritesOver) {
  std::string text = "password";
  EXPECT_TRUE(Sha1WithSaltHashPassword(text, "salt", text));
  EXPECT_EQ("c88e9c67041a74e0357befdff93f87dde0904214", text);
}

TEST(Sha1WithSaltHashPassword, DigestsTenMegabytes) {
  EXPECT_EQ("83cc369e6d2bd16117e3b13db9e971e72f5bcf59", Sha1(std::string(10u << 20, 'x'), ""));
}

TEST(Md5HashPassword, DigestsThePassword) {
  EXPECT_EQ("5f4dcc3b5aa765d61d8327deb882cf99", Md5("password"));
}

TEST(Md5HashPassword, DigestsZeroBytes) {
  EXPECT_EQ("70350f6027bce3713f6b76473084309b", Md5(std::string("a\0b", 3)));
}

TEST(Md5HashPassword, DigestsTenMegabytes) {
  EXPECT_EQ("46f40f95feefb6ab49b2b3679b5ec0a2", Md5(std::string(10u << 20, 'x')));
}

TEST(Md5HashPassword, RefusesAnEmptyPassword) {
  std::string digest = "before";
  EXPECT_FALSE(MD5HashPassword("", digest));
  EXPECT_EQ("before", digest);
}

}  // namespace
