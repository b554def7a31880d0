#include "server/message_head.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

namespace {

using web::HeadVerdict;
using web::IsAccountedFor;
using web::JudgeHead;
using web::RawField;
using web::Request;

/// A head as it lies in memory when the HTTP library has parsed it: line ends and colons are zero
/// bytes, and fields point into it.
struct ParsedHead {
  explicit ParsedHead(std::string text) : bytes(std::move(text)) {
    for (char &byte : bytes)
      if (byte == '\r' || byte == '\n' || byte == ':') byte = '\0';
  }

  std::string_view Find(std::string_view part) const {
    return std::string_view(bytes).substr(bytes.find(part), part.size());
  }
  bool IsAccountedFor(const std::vector<RawField> &fields) const {
    return web::IsAccountedFor(bytes, Find("HTTP/1.1"), fields);
  }

  std::string bytes;
};

TEST(WebMessageHead, LinesOneBehindTheOtherAreAccountedFor) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x\r\nAccept:y\r\n\r\n");
  EXPECT_TRUE(head.IsAccountedFor(
      {{head.Find("Host"), head.Find("x")}, {head.Find("Accept"), head.Find("y")}}));
}

TEST(WebMessageHead, BlanksAroundAValueAreAccountedFor) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: \t x \t\r\n\r\n");
  EXPECT_TRUE(head.IsAccountedFor({{head.Find("Host"), head.Find("x")}}));
}

TEST(WebMessageHead, AHeadWithoutFieldsIsAccountedFor) {
  EXPECT_TRUE(ParsedHead("GET / HTTP/1.1\r\n\r\n").IsAccountedFor({}));
}

TEST(WebMessageHead, AFieldThatWasPassedOverIsNot) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x\r\nSecret: y\r\n\r\n");
  EXPECT_FALSE(head.IsAccountedFor({{head.Find("Host"), head.Find("x")}}));
}

TEST(WebMessageHead, AFoldedLineIsNot) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x\r\n more\r\n\r\n");
  const std::string elsewhere = "x more";
  EXPECT_FALSE(head.IsAccountedFor({{head.Find("Host"), elsewhere}}));
  EXPECT_FALSE(head.IsAccountedFor({{head.Find("Host"), head.Find("x")}}));
}

TEST(WebMessageHead, AnEndThatComesTooEarlyIsNot) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x\r\n: y\r\n");
  EXPECT_FALSE(head.IsAccountedFor({{head.Find("Host"), head.Find("x")}}));
}

TEST(WebMessageHead, ALineThatEndsInALineFeedAloneIsNot) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x\nAccept: y\r\n\r\n");
  EXPECT_FALSE(head.IsAccountedFor(
      {{head.Find("Host"), head.Find("x")}, {head.Find("Accept"), head.Find("y")}}));
}

TEST(WebMessageHead, BytesOutsideOfItAreNeverLookedAt) {
  const ParsedHead head("GET / HTTP/1.1\r\nHost: x");
  EXPECT_FALSE(head.IsAccountedFor({{head.Find("Host"), head.Find("x")}}));
}

HeadVerdict Judge(std::vector<std::pair<std::string, std::string>> fields,
                  std::string_view version = "HTTP/1.1") {
  Request request;
  for (auto &[name, value] : fields) request.headers.Add(name, value);
  return JudgeHead(request, version);
}

TEST(WebMessageHead, AHostAndNoBodyIsServed) {
  EXPECT_EQ(Judge({{"Host", "x"}}).refusal, 0);
  EXPECT_EQ(Judge({}, "HTTP/1.0").refusal, 0);
}

TEST(WebMessageHead, TheHostMustBeGivenOnce) {
  EXPECT_EQ(Judge({}).refusal, 400);
  EXPECT_EQ(Judge({{"Host", "x"}, {"host", "x"}}).refusal, 400);
}

TEST(WebMessageHead, TheLengthIsTold) {
  EXPECT_EQ(Judge({{"Host", "x"}, {"Content-Length", "65536"}}).refusal, 0);
  EXPECT_EQ(Judge({{"Host", "x"}, {"Content-Length", "65536"}}).body_length, 65536u);
}

TEST(WebMessageHead, AFormThatIsTooLargeIsRefused) {
  EXPECT_EQ(Judge({{"Host", "x"}, {"Content-Length", "65537"}}).refusal, 413);
}

TEST(WebMessageHead, ALengthThatIsNoPlainNumberIsRefused) {
  for (const char *length : {"", " 1", "+1", "-1", "0x1", "1, 1", "1 ", "18446744073709551616"})
    EXPECT_EQ(Judge({{"Host", "x"}, {"Content-Length", length}}).refusal, 400) << length;
}

TEST(WebMessageHead, TwoLengthsAreRefusedAlsoWhenTheyAreEqual) {
  EXPECT_EQ(Judge({{"Host", "x"}, {"Content-Length", "1"}, {"content-length", "1"}}).refusal, 400);
}

TEST(WebMessageHead, ChunksAreRefused) {
  EXPECT_EQ(Judge({{"Host", "x"}, {"Transfer-Encoding", "chunked"}}).refusal, 411);
  EXPECT_EQ(
      Judge({{"Host", "x"}, {"Transfer-Encoding", "chunked"}, {"Content-Length", "1"}}).refusal,
      400);
}

TEST(WebMessageHead, ANameThatIsNoneIsRefused) {
  for (const char *name : {"", "Two words", "Transfer-Encoding ", "Caf\xc3\xa9", "a\x01"})
    EXPECT_EQ(Judge({{"Host", "x"}, {name, "y"}}).refusal, 400) << name;
}

TEST(WebMessageHead, OtherVersionsAreRefused) {
  for (const char *version : {"HTTP/2.0", "HTTP/1.2", "http/1.1", "", "HTTP/1.1x"})
    EXPECT_EQ(Judge({{"Host", "x"}}, version).refusal, 505) << version;
}

TEST(WebMessageHead, WhatConcernsTheConnectionOrConfusesCgiIsTakenAway) {
  Request request;
  for (const char *name : {"Host", "connection", "TE", "Proxy", "Upgrade", "Expect", "X_A", "X-A"})
    request.headers.Add(name, "x");
  JudgeHead(request, "HTTP/1.1");
  std::string left;
  for (const auto &field : request.headers) left += field.first + " ";
  EXPECT_EQ(left, "Host X-A ");
}

}  // namespace
