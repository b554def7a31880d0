#include <gtest/gtest.h>

#include "site/accept.h"

namespace {

TEST(Accept, JsonHasToBeNamed) {
  for (const char *accept :
       {"", "*/*", "text/html", "application/*", "text/html,application/xhtml+xml,*/*;q=0.8",
        "application/jsonx", "application/json-seq", "nonsense", ",,,;;;", "application/xml"})
    EXPECT_FALSE(web::PrefersJson(accept)) << accept;
}

TEST(Accept, JsonIsGivenToWhoPrefersIt) {
  for (const char *accept :
       {"application/json", "APPLICATION/JSON", " application/json ;q=0.5",
        "application/json, text/plain, */*", "application/json;charset=utf-8",
        "text/html;q=0.5, application/json", "text/html;q=0.899,application/json;q=0.9",
        "application/json;q=1.000", "application/json;q=0.001"})
    EXPECT_TRUE(web::PrefersJson(accept)) << accept;
}

TEST(Accept, APageIsGivenToWhoPrefersThatOrDoesNotMind) {
  for (const char *accept :
       {"application/json;q=0", "application/json, text/html", "text/html, application/json;q=0.9",
        "application/json;q=0.5, */*", "application/json;q=2", "application/json;q=x",
        "application/json;q=0.1, application/xhtml+xml;q=0.2", "application/json;q=0.0001"})
    EXPECT_FALSE(web::PrefersJson(accept)) << accept;
}

}  // namespace
