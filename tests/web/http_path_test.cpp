#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "http/path.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using web::JoinPath;
using web::SplitPath;

TEST(Path, SplitsAndDecodesComponents) {
  const auto parts = SplitPath("/a%20b/c");
  ASSERT_TRUE(parts);
  EXPECT_THAT(parts->components, ElementsAre("a b", "c"));
  EXPECT_FALSE(parts->ends_with_slash);
}

TEST(Path, TellsWhetherItEndsWithASlash) {
  const auto parts = SplitPath("/a/");
  ASSERT_TRUE(parts);
  EXPECT_THAT(parts->components, ElementsAre("a"));
  EXPECT_TRUE(parts->ends_with_slash);
}

TEST(Path, NothingAndASlashHaveNoComponents) {
  for (const char *path : {"", "/"}) {
    const auto parts = SplitPath(path);
    ASSERT_TRUE(parts) << path;
    EXPECT_THAT(parts->components, IsEmpty());
  }
}

TEST(Path, RefusesWhatIsNoName) {
  for (const char *path :
       {"a", "//", "//a", "/a//b", "/a//", "/.", "/..", "/a/../b", "/a/.", "/%2e%2e/b", "/%2e",
        "/.%2e", "/%2E.", "/a%2fb", "/%2F", "/a%00", "/%", "/a b"})
    EXPECT_FALSE(SplitPath(path)) << path;
}

TEST(Path, NamesWithDotsAreNames) {
  const auto parts = SplitPath("/.../..a/a..");
  ASSERT_TRUE(parts);
  EXPECT_THAT(parts->components, ElementsAre("...", "..a", "a.."));
}

TEST(Path, SplitsWhatItJoins) {
  const std::vector<std::string> components = {"a/b", "ä ?", "100%"};
  const auto parts = SplitPath("/" + JoinPath({"x"}).substr(1) + JoinPath({"ä ?", "100%"}));
  ASSERT_TRUE(parts);
  EXPECT_THAT(parts->components, ElementsAre("x", "ä ?", "100%"));
  EXPECT_EQ("/a%2Fb/%C3%A4%20%3F/100%25", JoinPath(components));
}

}  // namespace
