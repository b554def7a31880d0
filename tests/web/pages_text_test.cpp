// What pages do to bytes of unknown origin: names, texts, addresses.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "pages/addresses.h"
#include "pages/page_data.h"
#include "pages/shown_text.h"

namespace web {
namespace {

const std::string kMark = "\uFFFD";

TEST(ShownName, LeavesUtf8AsItIs) {
  for (const std::string name :
       {"", "a.txt", "Größe.txt", "日本語", "\U0001F600", " two  blanks "}) {
    EXPECT_EQ(name, ShownName(name));
  }
}

TEST(ShownName, MarksEachBrokenByte) {
  const std::vector<std::pair<std::string, std::string>> table = {
      {"a\xFFz", "a" + kMark + "z"},                        // never a byte of UTF-8
      {"\x80", kMark},                                      // a continuation of nothing
      {"\xC3", kMark},                                      // cut off
      {"\xE2\x82", kMark + kMark},                          // cut off later
      {"\xC0\xAF", kMark + kMark},                          // a slash written too long
      {"\xE0\x80\xAF", kMark + kMark + kMark},              // and longer
      {"\xED\xA0\x80", kMark + kMark + kMark},              // half of a pair of UTF-16
      {"\xF4\x90\x80\x80", kMark + kMark + kMark + kMark},  // beyond the last character
      {"\xC3(", kMark + "("},                               // the byte behind is not eaten
  };
  for (const auto &[bytes, shown] : table) EXPECT_EQ(shown, ShownName(bytes));
}

TEST(ShownName, MarksControlCharactersAndNul) {
  EXPECT_EQ("a" + kMark + "b" + kMark + "c" + kMark, ShownName(std::string("a\0b\nc\x7F", 6)));
  EXPECT_EQ(kMark, ShownName("\u0085"));
}

TEST(ShownName, DoesNotLetANameTurnAround) {
  EXPECT_EQ("photo" + kMark + "gpj.exe", ShownName("photo\u202Egpj.exe"));
  EXPECT_EQ(kMark + "a" + kMark, ShownName("\u2066a\u2069"));
}

TEST(ShownText, KeepsLinesAndTabsOnly) {
  EXPECT_EQ("a\n\tb\r\n" + kMark + "[0m", ShownText("a\n\tb\r\n\x1B[0m"));
}

TEST(ShownText, TakesTheMarkOfUtf8Off) {
  EXPECT_EQ("a", ShownText("\xEF\xBB\xBF"
                           "a"));
}

TEST(WithoutCutCharacter, TakesOffWhatIsCutAndNothingElse) {
  EXPECT_EQ("a", WithoutCutCharacter("a\xE2\x82"));
  EXPECT_EQ("a", WithoutCutCharacter("a\xF0"));
  EXPECT_EQ("a\u20AC", WithoutCutCharacter("a\u20AC"));
  EXPECT_EQ("", WithoutCutCharacter(""));
  EXPECT_EQ("\x80\x80", WithoutCutCharacter("\x80\x80"));
}

TEST(SurvivesForms, RefusesWhatBrowsersChange) {
  EXPECT_TRUE(SurvivesForms("Größe & <b>.txt"));
  EXPECT_FALSE(SurvivesForms("a\nb"));
  EXPECT_FALSE(SurvivesForms("a\rb"));
  EXPECT_FALSE(SurvivesForms("a\xFF"));
}

TEST(Addresses, EncodeEachByteOfEachComponent) {
  const Addresses addresses("/sharing");
  EXPECT_EQ("/sharing/aB3", addresses.Link("aB3"));
  EXPECT_EQ("/sharing/aB3/logout", addresses.Logout("aB3"));
  EXPECT_EQ("/sharing/aB3/a%20b/%FF%2Fc%3F%23%25%22%27",
            addresses.File("aB3", {"a b", "\xFF/c?#%\"'"}));
  EXPECT_EQ("/sharing/aB3/a/", addresses.Folder("aB3", {"a"}));
  EXPECT_EQ("/sharing/aB3", addresses.Folder("aB3", {}));
  EXPECT_EQ("/sharing/aB3", addresses.File("aB3", {}));
  EXPECT_EQ("/-/style.css", Addresses("").Asset("style.css"));
}

TEST(WebAddressOnly, TakesHttpAndHttpsAlone) {
  EXPECT_EQ("https://example.org/a?b#c", WebAddressOnly("https://example.org/a?b#c"));
  EXPECT_EQ("HTTP://example.org", WebAddressOnly("HTTP://example.org"));
  for (const char *address :
       {"", "https://", "javascript:alert(1)", "data:text/html,x", "//example.org", "/sharing",
        " https://example.org", "https:example.org", "https://example.org/\n", "https://a b",
        "https://a\"b", "https://a'b", "https://a<b", "java\tscript:x", "ftp://example.org"}) {
    EXPECT_EQ("", WebAddressOnly(address)) << address;
  }
}

TEST(HostOf, IsTheOneThatABrowserGoesTo) {
  EXPECT_EQ("example.org", HostOf("https://example.org"));
  EXPECT_EQ("example.org:8443", HostOf("https://example.org:8443/a@b"));
  EXPECT_EQ("evil.example", HostOf("https://bank.example@evil.example/"));
  EXPECT_EQ("evil.example", HostOf("https://evil.example\\@bank.example/"));
  EXPECT_EQ("evil.example", HostOf("https://evil.example?@bank.example/"));
  EXPECT_EQ("", HostOf(""));
}

}  // namespace
}  // namespace web
