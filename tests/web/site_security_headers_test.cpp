#include <gtest/gtest.h>

#include "site/security_headers.h"
#include "support/log_capture.h"

namespace {

using web::AddSecurityHeaders;
using web::Response;

TEST(SecurityHeaders, AreOnAnEmptyAnswer) {
  Response response;
  AddSecurityHeaders(response);
  EXPECT_NE(std::string::npos,
            response.headers.Get("Content-Security-Policy").find("frame-ancestors 'none'"));
  EXPECT_EQ("nosniff", response.headers.Get("X-Content-Type-Options"));
  EXPECT_EQ("no-referrer", response.headers.Get("Referrer-Policy"));
  EXPECT_TRUE(response.headers.Get("X-Robots-Tag").starts_with("noindex"));
  EXPECT_EQ("no-store", response.headers.Get("Cache-Control"));
  EXPECT_EQ("same-origin", response.headers.Get("Cross-Origin-Opener-Policy"));
  EXPECT_EQ("same-origin", response.headers.Get("Cross-Origin-Resource-Policy"));
  EXPECT_FALSE(response.headers.Get("Permissions-Policy").empty());
}

TEST(SecurityHeaders, LeaveWhatIsThereAlone) {
  Response response;
  response.headers.Add("Content-Security-Policy", "sandbox");
  response.headers.Add("cache-control", "private");
  AddSecurityHeaders(response);
  EXPECT_EQ("sandbox", response.headers.Get("Content-Security-Policy"));
  EXPECT_EQ(1u, response.headers.Count("Cache-Control"));
}

TEST(SecurityHeaders, TakeBrokenFieldsAway) {
  const velk_test::LogCapture log;
  for (const std::string &value :
       {std::string("a\r\nSet-Cookie: b=c"), std::string("a\nb"), std::string("a\0b", 3)}) {
    Response response;
    response.headers.Add("Location", value);
    AddSecurityHeaders(response);
    EXPECT_EQ(nullptr, response.headers.Find("Location"));
  }
  EXPECT_EQ(3u, log.lines().size());
}

}  // namespace
