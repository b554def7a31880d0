#include "server/trusted_proxies.h"

#include <gtest/gtest.h>

namespace {

using web::Request;
using web::TrustedProxies;

const TrustedProxies kProxies({"192.0.2.1", "192.0.2.2", "unix"});

Request Forwarded(const std::vector<std::string> &chains, const std::string &scheme = "http") {
  Request request;
  for (const std::string &chain : chains) request.headers.Add("X-Forwarded-For", chain);
  request.headers.Add("X-Forwarded-Proto", scheme);
  return request;
}

std::string Visitor(const std::string &peer, const std::vector<std::string> &chains) {
  Request request = Forwarded(chains);
  return kProxies.Identify(peer, request) ? request.remote_address : "nobody";
}

TEST(WebTrustedProxies, AStrangerIsTheVisitorWhateverHeSays) {
  Request request = Forwarded({"203.0.113.9"}, "https");
  ASSERT_TRUE(kProxies.Identify("198.51.100.1", request));
  EXPECT_EQ(request.remote_address, "198.51.100.1");
  EXPECT_FALSE(request.is_https);
}

TEST(WebTrustedProxies, AProxyTellsTheVisitorAndTheScheme) {
  Request request = Forwarded({"203.0.113.9"}, "https");
  ASSERT_TRUE(kProxies.Identify("192.0.2.1", request));
  EXPECT_EQ(request.remote_address, "203.0.113.9");
  EXPECT_TRUE(request.is_https);
}

TEST(WebTrustedProxies, TheLastThatIsNoProxyCounts) {
  EXPECT_EQ(Visitor("192.0.2.1", {"10.0.0.1, 203.0.113.9, 192.0.2.2"}), "203.0.113.9");
  EXPECT_EQ(Visitor("192.0.2.1", {"10.0.0.1", "203.0.113.9"}), "203.0.113.9");
  EXPECT_EQ(Visitor("192.0.2.1", {"192.0.2.2"}), "192.0.2.2");
}

TEST(WebTrustedProxies, AProxyThatForwardsNobodyIsTheVisitor) {
  EXPECT_EQ(Visitor("192.0.2.1", {}), "192.0.2.1");
}

TEST(WebTrustedProxies, WhatIsNoAddressIsNobody) {
  for (const char *chain : {"unknown", "203.0.113.9,", "203.0.113.9:80", "203.0.113.9, x"})
    EXPECT_EQ(Visitor("192.0.2.1", {chain}), "nobody") << chain;
}

TEST(WebTrustedProxies, AddressesAreWrittenInOneWay) {
  EXPECT_EQ(Visitor("192.0.2.1", {" ::ffff:203.0.113.9 "}), "203.0.113.9");
  EXPECT_EQ(Visitor("192.0.2.1", {"2001:DB8:0::1"}), "2001:db8::1");
}

TEST(WebTrustedProxies, ASocketWithAPathNeedsTheWordOfItsProxy) {
  EXPECT_EQ(Visitor("", {"203.0.113.9"}), "203.0.113.9");
  EXPECT_EQ(Visitor("", {}), "nobody");
  Request request = Forwarded({"203.0.113.9"});
  EXPECT_FALSE(TrustedProxies({}).Identify("", request));
}

}  // namespace
