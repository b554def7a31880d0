#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "site/routes.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using web::FindRoute;
using web::Route;

TEST(Routes, KnowALink) {
  const Route route = FindRoute("/sharing", "/sharing/aB3xK9pQ2");
  EXPECT_EQ(Route::LINK, route.kind);
  EXPECT_EQ("aB3xK9pQ2", route.hash);
  EXPECT_THAT(route.parts, IsEmpty());
}

TEST(Routes, KnowWhatIsBelowALink) {
  const Route route = FindRoute("/sharing", "/sharing/abc/a%20b/c/");
  EXPECT_EQ(Route::LINK, route.kind);
  EXPECT_THAT(route.parts, ElementsAre("a b", "c"));
  EXPECT_TRUE(route.ends_with_slash);
}

TEST(Routes, KnowAssetsAndHealth) {
  const Route asset = FindRoute("/sharing", "/sharing/-/style.css");
  EXPECT_EQ(Route::ASSET, asset.kind);
  EXPECT_THAT(asset.parts, ElementsAre("style.css"));
  EXPECT_EQ(Route::HEALTH, FindRoute("/sharing", "/sharing-health").kind);
}

TEST(Routes, MayLieAtTheRoot) {
  EXPECT_EQ("abc", FindRoute("", "/abc/d").hash);
  EXPECT_EQ(Route::HEALTH, FindRoute("", "/-health").kind);
  EXPECT_EQ(Route::ASSET, FindRoute("", "/-/style.css").kind);
}

TEST(Routes, KnowTheWayOut) {
  EXPECT_TRUE(FindRoute("/sharing", "/sharing/abc/logout").IsLogout());
  EXPECT_FALSE(FindRoute("/sharing", "/sharing/abc/logout/").IsLogout());
  EXPECT_FALSE(FindRoute("/sharing", "/sharing/abc/a/logout").IsLogout());
}

TEST(Routes, LeadNowhereElse) {
  const std::string long_hash(65, 'a');
  for (const std::string path : {"",
                                 "/",
                                 "/sharing",
                                 "/sharing/",
                                 "/sharin",
                                 "/sharingabc",
                                 "/sharing-healthy",
                                 "/sharing-health/",
                                 "/other/abc",
                                 "/sharing//abc",
                                 "/sharing/a-b",
                                 "/sharing/a.b",
                                 "/sharing/-",
                                 "/sharing/-/",
                                 "/sharing/-/a/b",
                                 "/sharing/-/a/",
                                 "/sharing/abc//d",
                                 "/sharing/abc/../d",
                                 "/sharing/%2e%2e/abc",
                                 "/sharing/abc/%2e%2e/def",
                                 "http://x/sharing/abc",
                                 "/sharing/ab%00c",
                                 "/sharing/%"})
    EXPECT_EQ(Route::NOWHERE, FindRoute("/sharing", path).kind) << path;
  EXPECT_EQ(Route::NOWHERE, FindRoute("/sharing", "/sharing/" + long_hash).kind);
}

}  // namespace
