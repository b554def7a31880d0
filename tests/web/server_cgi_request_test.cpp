#include "server/cgi_request.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

namespace {

using web::CgiRequest;
using web::ReadCgiRequest;

CgiRequest Read(std::vector<const char *> variables, std::string body = "") {
  variables.push_back(nullptr);
  return ReadCgiRequest(variables.data(), [&body](char *buffer, size_t size) {
    size = std::min({size, body.size(), size_t{3}});
    memcpy(buffer, body.data(), size);
    body.erase(0, size);
    return static_cast<ssize_t>(size);
  });
}

TEST(WebCgiRequest, HasWhatTheWebServerTells) {
  const CgiRequest cgi =
      Read({"REQUEST_METHOD=POST", "REQUEST_URI=/sharing/a%2Fb?x=%41", "REMOTE_ADDR=192.0.2.7",
            "HTTPS=on", "CONTENT_TYPE=text/plain", "CONTENT_LENGTH=7", "HTTP_ACCEPT_LANGUAGE=de",
            "SCRIPT_NAME=/sharing", "PATH_INFO=/a/b", "QUERY_STRING=x=A"},
           "foo=bar");
  EXPECT_EQ(cgi.refusal, 0);
  EXPECT_EQ(cgi.request.method, "POST");
  EXPECT_EQ(cgi.request.path, "/sharing/a%2Fb");
  EXPECT_EQ(cgi.request.query, "x=%41");
  EXPECT_EQ(cgi.request.remote_address, "192.0.2.7");
  EXPECT_TRUE(cgi.request.is_https);
  EXPECT_EQ(cgi.request.headers.Get("Accept-Language"), "de");
  EXPECT_EQ(cgi.request.headers.Get("Content-Type"), "text/plain");
  EXPECT_EQ(cgi.request.body, "foo=bar");
}

TEST(WebCgiRequest, EncodesADecodedPathAgain) {
  const CgiRequest cgi =
      Read({"SCRIPT_NAME=/sharing", "PATH_INFO=/a b/100%/\xc3\xa4?", "QUERY_STRING=zip"});
  EXPECT_EQ(cgi.request.path, "/sharing/a%20b/100%25/%C3%A4%3F");
  EXPECT_EQ(cgi.request.query, "zip");
}

TEST(WebCgiRequest, ComesByHttpUnlessToldOtherwise) {
  EXPECT_FALSE(Read({"REQUEST_URI=/"}).request.is_https);
  EXPECT_FALSE(Read({"REQUEST_URI=/", "HTTPS="}).request.is_https);
  EXPECT_FALSE(Read({"REQUEST_URI=/", "HTTPS=off"}).request.is_https);
  EXPECT_FALSE(Read({"REQUEST_URI=/", "HTTP_X_FORWARDED_PROTO=https"}).request.is_https);
}

TEST(WebCgiRequest, TakesTheVisitorFromNothingButRemoteAddr) {
  EXPECT_EQ(Read({"REQUEST_URI=/", "HTTP_X_FORWARDED_FOR=203.0.113.9", "HTTP_REMOTE_ADDR=x"})
                .request.remote_address,
            "");
}

TEST(WebCgiRequest, HasNoFieldNamedProxy) {
  EXPECT_EQ(Read({"REQUEST_URI=/", "HTTP_PROXY=evil"}).request.headers.Count("Proxy"), 0u);
}

TEST(WebCgiRequest, IsRefusedWithoutATarget) {
  EXPECT_EQ(Read({"REQUEST_METHOD=GET"}).refusal, 400);
  EXPECT_EQ(Read({"REQUEST_URI=*"}).refusal, 400);
}

TEST(WebCgiRequest, IsRefusedWithAHeadThatIsTooLarge) {
  const std::string variable = "HTTP_X=" + std::string(16 * 1024, 'x');
  EXPECT_EQ(Read({"REQUEST_URI=/", variable.c_str()}).refusal, 431);
}

TEST(WebCgiRequest, IsRefusedWithAFormThatIsTooLargeOrTooShort) {
  EXPECT_EQ(Read({"REQUEST_URI=/", "CONTENT_LENGTH=65537"}, std::string(65537, 'x')).refusal, 413);
  const CgiRequest cgi = Read({"REQUEST_URI=/", "CONTENT_LENGTH=10"}, "short");
  EXPECT_EQ(cgi.refusal, 400);
  EXPECT_EQ(cgi.request.body, "");
}

TEST(WebCgiRequest, IsRefusedWithALengthThatIsNone) {
  for (const char *length : {"CONTENT_LENGTH=x", "CONTENT_LENGTH=-1", "CONTENT_LENGTH=1 ",
                             "CONTENT_LENGTH=99999999999999999999"})
    EXPECT_EQ(Read({"REQUEST_URI=/", length}).refusal, 400) << length;
}

}  // namespace
