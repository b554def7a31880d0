#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <velk/velkcgi.h>
#include <velksharing/constants.h>

#include "site/cgi_environment.h"

namespace {

using testing::Contains;
using testing::Each;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using web::CgiEnvironment;
using web::CgiName;
using web::PlatformRequest;
using web::Request;

Request Sample() {
  Request request;
  request.method = "POST";
  request.path = "/sharing/abc";
  request.query = "a=1";
  request.remote_address = "192.0.2.7";
  request.body = "password=x";
  request.headers.Add("Content-Type", "application/x-www-form-urlencoded");
  request.headers.Add("Cookie", "a=1");
  return request;
}

TEST(CgiEnvironment, SaysWhatCgiSays) {
  Request request = Sample();
  request.is_https = true;
  request.headers.Add("Accept-Language", "de");
  const auto environment = CgiEnvironment(request);
  for (const char *variable : {"REMOTE_ADDR=192.0.2.7", "REQUEST_METHOD=POST", "QUERY_STRING=a=1",
                               "HTTPS=on", "CONTENT_TYPE=application/x-www-form-urlencoded",
                               "CONTENT_LENGTH=10", "HTTP_COOKIE=a=1", "HTTP_ACCEPT_LANGUAGE=de"})
    EXPECT_THAT(environment, Contains(variable));
}

TEST(CgiEnvironment, HasNoHttpsForPlainHttp) {
  EXPECT_THAT(CgiEnvironment(Sample()), Each(Not(StartsWith("HTTPS="))));
}

TEST(CgiEnvironment, HasNoProxyFromTheRequest) {
  for (const char *name : {"Proxy", "proxy", "PROXY"}) {
    Request request = Sample();
    request.headers.Add(name, "http://evil.example");
    EXPECT_THAT(CgiEnvironment(request), Each(Not(HasSubstr("evil")))) << name;
  }
}

TEST(CgiEnvironment, HasNoFieldWhoseNameCouldPassForAnother) {
  for (const char *name : {"X_Velk_Sharing", "X-Velk_Sharing", "Pro xy", "", "X=Y", "X\nY", "Ä"}) {
    Request request = Sample();
    request.headers.Add(name, "smuggled");
    EXPECT_THAT(CgiEnvironment(request), Each(Not(HasSubstr("smuggled")))) << name;
  }
}

TEST(CgiEnvironment, DoesNotLetAFieldReplaceWhatTheServerSays) {
  Request request = Sample();
  request.headers.Add("Content-Length", "999");
  request.headers.Add("Remote-Addr", "198.51.100.1");
  const auto environment = CgiEnvironment(request);
  EXPECT_THAT(environment, Contains("REMOTE_ADDR=192.0.2.7"));
  EXPECT_THAT(environment, Contains("CONTENT_LENGTH=10"));
  EXPECT_THAT(environment, Each(Not(HasSubstr("999"))));
}

TEST(CgiEnvironment, JoinsFieldsOfOneName) {
  Request request = Sample();
  request.headers.Add("cookie", "b=2");
  request.headers.Add("X-A", "1");
  request.headers.Add("x-a", "2");
  EXPECT_THAT(CgiEnvironment(request), Contains("HTTP_COOKIE=a=1; b=2"));
  EXPECT_THAT(CgiEnvironment(request), Contains("HTTP_X_A=1, 2"));
}

TEST(CgiEnvironment, LeavesOutWhatCannotBeHandedOverWhole) {
  for (const std::string &value :
       {std::string("a\0b", 3), std::string("a\nb"), std::string("a\rb")}) {
    Request request = Sample();
    request.headers.Add("X-A", value);
    EXPECT_THAT(CgiEnvironment(request), Each(Not(StartsWith("HTTP_X_A="))));
  }
}

TEST(CgiName, IsTheConstantForTheFieldOfApiClients) {
  EXPECT_EQ(SZ_X_SHARING_HEADER, CgiName("X-Velk-Sharing"));
}

TEST(PlatformRequest, IsThePlatformsUntilTheEndOfTheScope) {
  char address[64] = "";
  const Request request = Sample();
  {
    const PlatformRequest current(request);
    ASSERT_EQ(0, VelkCgiGetRemoteIP(address, sizeof address));
    EXPECT_STREQ("192.0.2.7", address);
  }
  unsetenv("REMOTE_ADDR");
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(address, sizeof address));
}

}  // namespace
