#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "gate/prefix.h"

namespace {

using testing::ElementsAre;
using web::gate::Address;
using web::gate::CommonCookiePath;
using web::gate::Prefix;

std::string TextOf(std::string_view text) {
  const auto prefix = Prefix::Parse(text);
  return prefix ? prefix->text() : "refused";
}

bool Covers(std::string_view prefix, std::string_view address) {
  return Prefix::Parse(prefix).value().Covers(Address::Parse(address).value());
}

std::string CommonOf(const std::vector<std::string> &texts) {
  std::vector<Prefix> prefixes;
  for (const std::string &text : texts) prefixes.push_back(Prefix::Parse(text).value());
  return CommonCookiePath(prefixes);
}

TEST(GatePrefix, OfASiteHasItsOrigin) {
  const auto prefix = Prefix::Parse("https://wiki.example/a/b/");
  ASSERT_TRUE(prefix);
  EXPECT_EQ("https://wiki.example", prefix->origin());
  EXPECT_THAT(prefix->components(), ElementsAre("a", "b"));
}

TEST(GatePrefix, OfEverySiteHasNone) {
  EXPECT_EQ("", Prefix::Parse("/photos/").value().origin());
}

TEST(GatePrefix, ItsSpellingsAreOne) {
  for (const char *text : {"/photos", "/photos/", "/%70hotos", "/photo%73/"})
    EXPECT_EQ("/photos", TextOf(text)) << text;
  for (const char *text : {"https://wiki.example", "https://wiki.example/", "HTTPS://Wiki.Example.",
                           "https://WIKI.example:443/"})
    EXPECT_EQ("https://wiki.example/", TextOf(text)) << text;
  EXPECT_EQ(Prefix::Parse("/a%62/"), Prefix::Parse("/ab"));
}

TEST(GatePrefix, ItsTextIsAPrefixOfItsOwn) {
  for (const char *text : {"/", "/my%20photos/@x", "/caf%C3%A9", "/100%25", "/a(b)[c]|d",
                           "/%7Ba%7D", "http://[::1]:81/%22"}) {
    const auto prefix = Prefix::Parse(text);
    ASSERT_TRUE(prefix) << text;
    EXPECT_EQ(text, prefix->text());
    EXPECT_EQ(prefix, Prefix::Parse(prefix->text()));
  }
}

TEST(GatePrefix, MayBeWrittenWithoutEscapes) {
  EXPECT_EQ("/caf%C3%A9", TextOf("/caf\xc3\xa9"));
}

TEST(GatePrefix, RefusesWhatIsNone) {
  for (const char *text : {"",
                           "photos",
                           "photos/",
                           "*",
                           "/a?",
                           "/a?x",
                           "/a#",
                           "https://h/?",
                           "https://h#",
                           "ftp://h/",
                           "https://",
                           "https://u@h/",
                           "https://h:0/",
                           "h.example/",
                           "//h.example/",
                           "/a b",
                           "/a\n",
                           "/%00",
                           "/%",
                           "/%4",
                           "https://h\\a"})
    EXPECT_EQ("refused", TextOf(text)) << text;
  EXPECT_FALSE(Prefix::Parse(std::string_view("/a\0", 3)));
  EXPECT_FALSE(Prefix::Parse("/" + std::string(Address::kLongest, 'a')));
}

TEST(GatePrefix, RefusesAPathThatServersReadInSeveralWays) {
  for (const char *text : {"/a//b", "//", "/a/../b", "/./a", "/%2e%2e/", "/a%2Fb", "/a\\b", "/a;b",
                           "/a%3Bb", "/a%3F", "/%2561", "https://h//a"})
    EXPECT_EQ("refused", TextOf(text)) << text;
}

TEST(GatePrefix, CoversItselfAndAllBelow) {
  EXPECT_TRUE(Covers("/photos/", "https://h/photos"));
  EXPECT_TRUE(Covers("/photos", "http://other:81/photos/a/b?x"));
  EXPECT_TRUE(Covers("/", "https://h"));
  EXPECT_TRUE(Covers("https://h/a", "https://H:443/a/b"));
}

TEST(GatePrefix, CoversNothingBeside) {
  EXPECT_FALSE(Covers("/photos", "https://h/photosets"));
  EXPECT_FALSE(Covers("/photos", "https://h/photo"));
  EXPECT_FALSE(Covers("/photos", "https://h/a/photos"));
  EXPECT_FALSE(Covers("/photos", "https://h/Photos"));
  EXPECT_FALSE(Covers("/photos/trip", "https://h/photos"));
}

TEST(GatePrefix, OfASiteCoversNoOtherSite) {
  EXPECT_FALSE(Covers("https://h/", "http://h/"));
  EXPECT_FALSE(Covers("https://h/", "https://h:444/"));
  EXPECT_FALSE(Covers("https://h/", "https://h.example/"));
}

TEST(GatePrefix, CoversOnlyWhatEveryReadingLeavesInside) {
  EXPECT_TRUE(Covers("/photos", "https://h/photos/a//b/../c;d%2Fe"));
  EXPECT_FALSE(Covers("/photos", "https://h/photos/.."));
  EXPECT_FALSE(Covers("/photos", "https://h/x/../photos"));
  EXPECT_FALSE(Covers("/photos", "https://h//photos"));
}

TEST(GatePrefix, ItsCookiePathIsWhatBrowsersSend) {
  EXPECT_EQ("/", Prefix::Parse("https://h")->CookiePath());
  EXPECT_EQ("/photos", Prefix::Parse("https://h/photos/")->CookiePath());
  EXPECT_EQ("/my%20photos/@me/c++", Prefix::Parse("/my%20photos/%40me/c++")->CookiePath());
  EXPECT_EQ("/%E2%82%AC/100%25", Prefix::Parse("/%e2%82%ac/100%25")->CookiePath());
}

TEST(GatePrefix, SeveralHaveACommonPathOfWholeComponents) {
  EXPECT_EQ("/a/b", CommonOf({"/a/b/c", "https://h/a/b/d", "/a/b"}));
  EXPECT_EQ("/a", CommonOf({"/a/bc", "/a/bd"}));
  EXPECT_EQ("/", CommonOf({"/photos", "/photosets"}));
  EXPECT_EQ("/", CommonOf({"https://h/", "/photos"}));
  EXPECT_EQ("/my%20photos", CommonOf({"/my%20photos/x", "/my%20photos/y"}));
}

TEST(GatePrefix, OneHasItsOwnPathInCommonAndNoneTheRoot) {
  EXPECT_EQ("/a/b", CommonOf({"/a/b/"}));
  EXPECT_EQ("/", CommonOf({}));
}

}  // namespace
