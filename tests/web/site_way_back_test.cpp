#include "site/way_back.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using web::Form;
using web::Request;
using web::WayBack;

Request On(const std::string &host, bool is_https = true) {
  Request request;
  request.headers.Add("Host", host);
  request.is_https = is_https;
  return request;
}

std::vector<web::gate::Prefix> Prefixes(const std::vector<std::string> &texts) {
  std::vector<web::gate::Prefix> prefixes;
  for (const std::string &text : texts) prefixes.push_back(*web::gate::Prefix::Parse(text));
  return prefixes;
}

WayBack Way(const Request &request, const std::vector<std::string> &prefixes,
            const std::string &query = "") {
  return {request, *Form::Parse(query), Prefixes(prefixes)};
}

std::string Wanted(const std::string &query, const Request &request = On("wiki.example")) {
  return Way(request, {"https://wiki.example/wiki", "/photos"}, query).wanted();
}

TEST(SiteWayBack, LeadsToAPageThatTheLinkGuardsOnThisSite) {
  EXPECT_EQ("/wiki/page?id=7", Wanted("return=%2Fwiki%2Fpage%3Fid%3D7"));
  EXPECT_EQ("/wiki", Wanted("return=/wiki"));
  EXPECT_EQ("/photos/a", Wanted("zip&return=%2Fphotos%2Fa"));
}

TEST(SiteWayBack, LeadsNowhereElse) {
  for (const char *query :
       {"", "return", "return=", "return=/", "return=/wikipedia", "return=/wiki/..%2fother",
        "return=/wiki/%2e%2e/other", "return=//evil.example/wiki", "return=/%5Cevil.example/wiki",
        "return=https://wiki.example/wiki", "return=wiki", "return=/wiki%0d%0aX:y",
        "return=/wiki%23a", "return=/wiki%2500", "return=/wiki%25"})
    EXPECT_EQ("", Wanted(query)) << query;
}

TEST(SiteWayBack, AnotherSitesPrefixCoversNothingHere) {
  const std::string query = "return=/wiki/a";
  EXPECT_EQ("/wiki/a", Wanted(query, On("wiki.example:443")));
  EXPECT_EQ("", Wanted(query, On("other.example")));
  EXPECT_EQ("", Wanted(query, On("wiki.example:8443")));
  EXPECT_EQ("", Wanted(query, On("wiki.example", false)));
}

TEST(SiteWayBack, ARequestThatDoesNotSayWhichSiteLeadsNowhere) {
  Request twice = On("wiki.example");
  twice.headers.Add("host", "other.example");
  for (const Request &request : {Request{}, twice, On(""), On("wiki.example/wiki"),
                                 On("wiki.example?"), On("a b"), On("evil@wiki.example")}) {
    EXPECT_EQ("", Wanted("return=/wiki/a", request));
    EXPECT_EQ("", Wanted("return=/photos/a", request));
  }
}

TEST(SiteWayBack, WithoutAWishTheFirstPrefixHereIsTheGoal) {
  const Request here = On("wiki.example");
  EXPECT_EQ("/b/",
            Way(here, {"https://other.example/a", "https://wiki.example/b", "/c"}).Default());
  EXPECT_EQ("https://other.example/a/", Way(here, {"https://other.example/a"}).Default());
  EXPECT_EQ("/", Way(here, {"/"}).Default());
  EXPECT_EQ("", Way(here, {}).Default());
}

TEST(SiteWayBack, TheCookieGoesToWhatIsGuardedHere) {
  const Request here = On("wiki.example");
  EXPECT_EQ("/a", Way(here, {"https://wiki.example/a/b", "/a/c", "https://h/x"}).CookiePath());
  EXPECT_EQ("/my%20photos", Way(here, {"/my%20photos"}).CookiePath());
  EXPECT_EQ("/", Way(here, {"/a", "/b"}).CookiePath());
  EXPECT_EQ("", Way(here, {"https://other.example/a"}).CookiePath());
  EXPECT_EQ("", Way(here, {}).CookiePath());
}

}  // namespace
