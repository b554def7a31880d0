#include <gtest/gtest.h>

#include <set>
#include <string>
#include <vector>

#include "site/redirect_target.h"
#include "site_open_redirects.h"

namespace {

using web::IsWebAddress;

TEST(RedirectTarget, WebAddressesAreFine) {
  for (const char *address :
       {"http://example.org", "https://example.org/", "HTTPS://Example.ORG/a/b?c=d&e=%20#f",
        "https://example.org:8443/a", "http://192.0.2.1/x", "http://[2001:db8::1]/",
        "http://[2001:db8::1]:8080/", "https://xn--bcher-kva.example/", "http://a_b.example/",
        "http://localhost", "https://example.org/a@b", "https://example.org/?u=https://x.example/",
        "https://1.example/", "http://3com.example"})
    EXPECT_TRUE(IsWebAddress(address)) << address;
}

TEST(RedirectTarget, TricksAreNot) {
  const std::vector<std::string> spellings = velk_test::OpenRedirects();
  ASSERT_LE(300u, std::set<std::string>(spellings.begin(), spellings.end()).size());
  for (const std::string &spelling : spellings) EXPECT_FALSE(IsWebAddress(spelling)) << spelling;
}

TEST(RedirectTarget, NothingIsEndless) {
  const std::string address = "https://example.org/";
  EXPECT_TRUE(IsWebAddress(address + std::string(2048 - address.size(), 'a')));
  EXPECT_FALSE(IsWebAddress(address + std::string(2049 - address.size(), 'a')));
}

}  // namespace
