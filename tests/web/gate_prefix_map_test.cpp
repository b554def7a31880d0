#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "gate/prefix_map.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using web::gate::Address;
using web::gate::Prefix;
using web::gate::PrefixMap;

class GatePrefixMap : public testing::Test {
 protected:
  void Add(std::string_view prefix, std::string_view key) {
    guards_.Add(Prefix::Parse(prefix).value(), key);
  }
  const std::vector<std::string> &Find(std::string_view address) const {
    return guards_.Find(Address::Parse(address).value());
  }

  PrefixMap guards_;
};

TEST_F(GatePrefixMap, EmptyFindsNothing) {
  EXPECT_THAT(Find("https://h/"), IsEmpty());
  EXPECT_THAT(Find("https://h/a/b//c"), IsEmpty());
}

TEST_F(GatePrefixMap, FindsTheKeysOfTheLongestPrefix) {
  Add("/", "root");
  Add("/a/b", "deep");
  Add("/a", "flat");
  EXPECT_THAT(Find("https://h/a/b/c/d"), ElementsAre("deep"));
  EXPECT_THAT(Find("https://h/a/bc"), ElementsAre("flat"));
  EXPECT_THAT(Find("https://h/ab"), ElementsAre("root"));
}

TEST_F(GatePrefixMap, FindsAPrefixOfTheSiteBeforeALongerOneOfEverySite) {
  Add("https://h/", "site");
  Add("/a/b/c", "every");
  EXPECT_THAT(Find("https://h/a/b/c/d"), ElementsAre("site"));
  EXPECT_THAT(Find("https://g/a/b/c/d"), ElementsAre("every"));
}

TEST_F(GatePrefixMap, FindsAPrefixOfEverySiteWhereThoseOfTheSiteDoNotCover) {
  Add("https://h/a", "site");
  Add("/", "every");
  EXPECT_THAT(Find("https://h/b"), ElementsAre("every"));
}

TEST_F(GatePrefixMap, FindsAllKeysOfAPrefixInOrderAndOnce) {
  Add("/a", "two");
  Add("/a/", "one");
  Add("/%61", "two");
  Add("/a", "three");
  EXPECT_THAT(Find("https://h/a"), ElementsAre("one", "three", "two"));
}

TEST_F(GatePrefixMap, FindsNothingWhenReadingsDiffer) {
  Add("/", "lax");
  Add("/private", "strict");
  EXPECT_THAT(Find("https://h/a/../private"), IsEmpty());
  EXPECT_THAT(Find("https://h/private%2Fa"), IsEmpty());
}

TEST_F(GatePrefixMap, FindsNothingWhenOneReadingIsNotCovered) {
  Add("/a", "key");
  EXPECT_THAT(Find("https://h/a/.."), IsEmpty());
  EXPECT_THAT(Find("https://h//a"), IsEmpty());
}

TEST_F(GatePrefixMap, FindsKeysThatSeveralPrefixesShareWhateverTheReading) {
  Add("/a", "x");
  Add("/a", "y");
  Add("/a/b", "y");
  Add("/a/b", "x");
  EXPECT_THAT(Find("https://h/a//b"), ElementsAre("x", "y"));
}

TEST_F(GatePrefixMap, TakesAnyTextForAKey) {
  const std::string odd("\0\xff /", 4);
  Add("/a", odd);
  Add("/a", "");
  EXPECT_THAT(Find("https://h/a"), ElementsAre("", odd));
}

TEST_F(GatePrefixMap, SearchesADeepAddressNoDeeperThanItsPrefixes) {
  Add("/a/a", "key");
  std::string deep = "https://h";
  for (int depth = 0; depth < 8000; ++depth) deep += "/a";
  EXPECT_THAT(Find(deep), ElementsAre("key"));
}

TEST_F(GatePrefixMap, FindsEachOfVeryManyPrefixes) {
  constexpr int kMany = 20'000;
  for (int number = 0; number < kMany; ++number)
    Add("https://h/site/" + std::to_string(number), std::to_string(number));
  for (int number = 0; number < kMany; ++number) {
    const std::string name = std::to_string(number);
    ASSERT_THAT(Find("https://h/site/" + name + "/page"), ElementsAre(name));
  }
  EXPECT_THAT(Find("https://h/site"), IsEmpty());
}

}  // namespace
