#include <gtest/gtest.h>

#include "site/form_token.h"

namespace {

using web::FormTokens;
using web::IsFromOwnPage;
using web::Request;

const char *const kSecret = "0123456789abcdef0123456789abcdef";

TEST(FormTokens, ATokenIsRightForItsBrowserAndLink) {
  const FormTokens tokens(kSecret);
  const std::string key = FormTokens::NewKey();
  EXPECT_TRUE(FormTokens::IsKey(key));
  const std::string token = tokens.Token(key, "hash1");
  EXPECT_EQ(64u, token.size());
  EXPECT_TRUE(tokens.IsRight(token, key, "hash1"));
  EXPECT_TRUE(FormTokens(kSecret).IsRight(token, key, "hash1"));
}

TEST(FormTokens, ATokenIsWrongEverywhereElse) {
  const FormTokens tokens(kSecret);
  const std::string key = FormTokens::NewKey();
  const std::string token = tokens.Token(key, "hash1");
  EXPECT_FALSE(tokens.IsRight(token, key, "hash2"));
  EXPECT_FALSE(tokens.IsRight(token, FormTokens::NewKey(), "hash1"));
  EXPECT_FALSE(tokens.IsRight(token, "", "hash1"));
  EXPECT_FALSE(tokens.IsRight("", key, "hash1"));
  EXPECT_FALSE(tokens.IsRight("", "", "hash1"));
  EXPECT_FALSE(tokens.IsRight(token.substr(1), key, "hash1"));
  EXPECT_FALSE(tokens.IsRight(token + "0", key, "hash1"));
  EXPECT_FALSE(FormTokens("another secret of another site..").IsRight(token, key, "hash1"));
}

TEST(FormTokens, KeysDiffer) {
  EXPECT_NE(FormTokens::NewKey(), FormTokens::NewKey());
}

TEST(FormTokens, OnlyOurKeysAreKeys) {
  for (const char *text : {"", "abc", "0123456789ABCDEF0123456789ABCDEF",
                           "0123456789abcdef0123456789abcdeg", "0123456789abcdef0123456789abcdef0"})
    EXPECT_FALSE(FormTokens::IsKey(text)) << text;
}

Request From(const char *origin, const char *site = nullptr) {
  Request request;
  request.headers.Add("Host", "share.example:8080");
  if (origin != nullptr) request.headers.Add("Origin", origin);
  if (site != nullptr) request.headers.Add("Sec-Fetch-Site", site);
  return request;
}

TEST(IsFromOwnPage, OurOwnOriginIs) {
  EXPECT_TRUE(IsFromOwnPage(From("http://share.example:8080")));
  EXPECT_TRUE(IsFromOwnPage(From("https://SHARE.example:8080")));
}

TEST(IsFromOwnPage, WhoTellsNothingMayBe) {
  EXPECT_TRUE(IsFromOwnPage(From(nullptr)));
  EXPECT_TRUE(IsFromOwnPage(From("null")));
}

TEST(IsFromOwnPage, OtherOriginsAreNot) {
  for (const char *origin :
       {"https://evil.example", "http://share.example", "http://share.example:8081",
        "http://share.example:8080.evil.example", "http://evil.example/share.example:8080",
        "share.example:8080", "http://", "x"})
    EXPECT_FALSE(IsFromOwnPage(From(origin))) << origin;
}

TEST(IsFromOwnPage, TheUsualPortsNeedNotBeNamed) {
  Request request;
  request.headers.Add("Host", "share.example:443");
  request.headers.Add("Origin", "https://share.example");
  EXPECT_TRUE(IsFromOwnPage(request));
}

TEST(IsFromOwnPage, WhatTheBrowserSaysDecides) {
  EXPECT_TRUE(IsFromOwnPage(From("null", "same-origin")));
  EXPECT_TRUE(IsFromOwnPage(From(nullptr, "none")));
  for (const char *site : {"cross-site", "same-site", "x"})
    EXPECT_FALSE(IsFromOwnPage(From("null", site))) << site;
}

}  // namespace
