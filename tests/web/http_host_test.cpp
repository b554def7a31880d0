#include <gtest/gtest.h>

#include <string>

#include "http/host.h"

namespace {

using web::IsHost;
using web::PortNumber;
using web::SplitHostAndPort;

TEST(Host, IsANameOrAnIPAddress) {
  for (const char *text : {"h", "wiki.example", "WIKI.Example", "my_host-1.example", "1.example",
                           "192.0.2.7", "[::1]", "[2001:DB8::192.0.2.7]"})
    EXPECT_TRUE(IsHost(text)) << text;
}

TEST(Host, IsNothingThatReadersDisagreeAbout) {
  for (const char *text : {"",     ".",       "h.",         ".h",         "a..b",
                           "-h",   "h-",      "h%2e",       "h\\",        "h@g",
                           "h:80", "192.0.2", "192.0.2.07", "0x7f.1",     "3221225991",
                           "[]",   "[::1",    "::1",        "[::1%eth0]", "m\xc3\xbcnchen.example",
                           "a b",  "*"})
    EXPECT_FALSE(IsHost(text)) << text;
  EXPECT_FALSE(IsHost(std::string_view("[::1\0]", 6)));
  EXPECT_FALSE(IsHost(std::string(64, 'a')));
}

TEST(Host, APortIsANumberFrom1To65535) {
  EXPECT_EQ(1, PortNumber("1"));
  EXPECT_EQ(443, PortNumber("00443"));
  EXPECT_EQ(65535, PortNumber("65535"));
  for (const char *text : {"", "0", "00000", "65536", "000443", "-1", "+1", " 1", "1 ", "0x1", "a"})
    EXPECT_FALSE(PortNumber(text)) << text;
}

TEST(Host, ThePortStandsBehindTheColonThatIsNotOfIPv6) {
  EXPECT_EQ("[::1]", SplitHostAndPort("[::1]").host);
  EXPECT_FALSE(SplitHostAndPort("[::1]").port);
  EXPECT_EQ("[::1]", SplitHostAndPort("[::1]:80").host);
  EXPECT_EQ("80", SplitHostAndPort("[::1]:80").port);
  EXPECT_EQ("h", SplitHostAndPort("h:").host);
  EXPECT_EQ("", SplitHostAndPort("h:").port);
  EXPECT_EQ("1:2", SplitHostAndPort("h:1:2").port);
}

TEST(HttpHost, OneThatReachesIntoThePathIsFound) {
  for (const char *authority : {"wiki.example", "wiki.example:443", "[::1]:80", ""})
    EXPECT_TRUE(web::IsApartFromPath(authority)) << authority;
  for (const char *authority :
       {"wiki.example/", "wiki.example/a", "wiki.example?", "wiki.example#a", "a\\b", "/", "?"})
    EXPECT_FALSE(web::IsApartFromPath(authority)) << authority;
}

}  // namespace
