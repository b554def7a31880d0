#include <gtest/gtest.h>

#include <string>

#include "gate/local_target.h"

namespace {

using web::gate::IsLocalTarget;
using web::gate::kLongestLocalTarget;

TEST(GateLocalTarget, IsAPathOfTheSameSite) {
  for (const char *text : {"/", "/page", "/page?x=1&y=%20", "/a//b", "/?//x", "/a/../b", "/%5Cx",
                           "/%2F%2Fx", "/https://x.example/", "/@x", "/a?b?c", "/:80"})
    EXPECT_TRUE(IsLocalTarget(text)) << text;
}

TEST(GateLocalTarget, IsNothingThatLeadsToAnotherSite) {
  for (const char *text : {"//x.example", "///x.example", "//", "/\\x.example", "\\\\x.example",
                           "/\t/x.example", "/\n/x.example", "https://x.example/", "x.example",
                           "javascript:alert(1)", "?x", "#x", "\\/x.example", " //x.example"})
    EXPECT_FALSE(IsLocalTarget(text)) << text;
}

TEST(GateLocalTarget, IsNothingThatBreaksAHeader) {
  for (const char *text : {"", "/a b", "/a\rb", "/a\nb", "/a\tb", "/a\x7f", "/a\x01", "/\xc3\xa9",
                           "/a\\b", "/a#b", "/%", "/%4", "/%4g", "/a?%"})
    EXPECT_FALSE(IsLocalTarget(text)) << text;
  EXPECT_FALSE(IsLocalTarget(std::string_view("/a\0b", 4)));
  EXPECT_FALSE(IsLocalTarget(std::string_view()));
}

TEST(GateLocalTarget, HasALongestLength) {
  const std::string longest = "/" + std::string(kLongestLocalTarget - 1, 'a');
  EXPECT_TRUE(IsLocalTarget(longest));
  EXPECT_FALSE(IsLocalTarget(longest + "a"));
}

}  // namespace
