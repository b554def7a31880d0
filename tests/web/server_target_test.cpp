#include "server/target.h"

#include <gtest/gtest.h>

namespace {

using web::Request;
using web::SetTarget;

TEST(WebTarget, IsPathAndQueryAsTheyWereSent) {
  Request request;
  ASSERT_TRUE(SetTarget("/sharing/a%20b/?sort=%41&x=?", request));
  EXPECT_EQ(request.path, "/sharing/a%20b/");
  EXPECT_EQ(request.query, "sort=%41&x=?");
}

TEST(WebTarget, LosesSchemeAndHost) {
  Request request;
  for (const char *target : {"http://host/sharing?x", "HTTPS://user@host:80/sharing?x"}) {
    ASSERT_TRUE(SetTarget(target, request)) << target;
    EXPECT_EQ(request.path, "/sharing");
    EXPECT_EQ(request.query, "x");
  }
}

TEST(WebTarget, IsRefusedWhereItNamesNothingHere) {
  Request request;
  for (const char *target : {"", "*", "host:443", "sharing", "http://host", "http://host?x",
                             "ftp://host/x", "/a b", "/a\tb", "/a\x7f"})
    EXPECT_FALSE(SetTarget(target, request)) << target;
}

}  // namespace
