#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "gate/address.h"

namespace {

using testing::ElementsAre;
using testing::SizeIs;
using web::gate::Address;

std::string OriginOf(std::string_view text) {
  const auto address = Address::Parse(text);
  return address ? address->origin() : "refused";
}

TEST(GateAddress, TellsOriginAndTarget) {
  const auto address = Address::Parse("https://wiki.example/a%20b//c/?x=/..");
  ASSERT_TRUE(address);
  EXPECT_EQ("https://wiki.example", address->origin());
  EXPECT_EQ("/a%20b//c/?x=/..", address->target());
  EXPECT_EQ("https://wiki.example/a%20b//c/?x=/..", address->text());
}

TEST(GateAddress, AnOrdinaryAddressIsReadInOneWay) {
  for (const char *text : {"https://h/photos/2024/my%20trip/%C3%A9t%C3%A9.jpg?size=3", "https://h",
                           "https://h/a-b_c.d~e!$&'()*+,=:@/", "https://h/100%25"}) {
    const auto address = Address::Parse(text);
    ASSERT_TRUE(address) << text;
    EXPECT_THAT(address->readings(), SizeIs(1)) << text;
  }
}

TEST(GateAddress, TheSpellingsOfAnOriginAreOne) {
  for (const char *text :
       {"https://wiki.example/", "HTTPS://WIKI.Example", "https://wiki.example.",
        "https://wiki.example:443/", "https://wiki.example:0443", "https://wiki.example:/?x"})
    EXPECT_EQ("https://wiki.example", OriginOf(text)) << text;
}

TEST(GateAddress, KeepsAPortThatIsNotTheSchemes) {
  EXPECT_EQ("https://h:8443", OriginOf("https://h:08443"));
  EXPECT_EQ("https://h:80", OriginOf("https://h:80"));
  EXPECT_EQ("http://h:443", OriginOf("http://h:443"));
  EXPECT_EQ("http://h", OriginOf("http://h:80"));
}

TEST(GateAddress, ShortensIPv6) {
  EXPECT_EQ("http://[2001:db8::a]:81", OriginOf("http://[2001:0DB8:0:0::000A]:81/x"));
}

TEST(GateAddress, AnEmptyPathIsTheRoot) {
  EXPECT_EQ("/", Address::Parse("https://h")->target());
  EXPECT_EQ("", Address::Parse("https://h")->readings().front().text());
}

TEST(GateAddress, AHostThatEndsInAQuestionMarkMakesNoQueryOfThePath) {
  EXPECT_FALSE(Address::Parse("https://wiki.example?/private"));
  EXPECT_FALSE(Address::Parse("https://wiki.example:443?/private"));
  EXPECT_FALSE(Address::Parse("https://wiki.example?"));
}

TEST(GateAddress, ASlashAtTheEndMakesNoDifference) {
  EXPECT_EQ(Address::Parse("https://h/a/b")->readings(),
            Address::Parse("https://h/a/b/")->readings());
}

TEST(GateAddress, ItsTextIsAnAddressOfItsOwn) {
  const auto address = Address::Parse("HTTPS://[0::1]:443/?a//%61;b");
  ASSERT_TRUE(address);
  const auto again = Address::Parse(address->text());
  ASSERT_TRUE(again);
  EXPECT_EQ("https://[::1]/?a//%61;b", again->text());
  EXPECT_EQ(address->readings(), again->readings());
}

TEST(GateAddress, RefusesAZeroByteWhereverItStands) {
  const std::string text = "https://wiki.example/page?x";
  for (size_t at = 0; at <= text.size(); ++at) {
    std::string broken = text;
    broken.insert(at, 1, '\0');
    EXPECT_FALSE(Address::Parse(broken)) << at;
  }
}

TEST(GateAddress, RefusesNothingAndTooMuch) {
  EXPECT_FALSE(Address::Parse(""));
  EXPECT_FALSE(Address::Parse(std::string_view()));
  const std::string longest = "https://h/" + std::string(Address::kLongest - 10, 'a');
  EXPECT_TRUE(Address::Parse(longest));
  EXPECT_FALSE(Address::Parse(longest + "a"));
  EXPECT_FALSE(Address::Parse(std::string(50'000'000, '/')));
}

}  // namespace
