// What programs get.
#include "site_support.h"
#include "support/log_capture.h"

namespace {

using velk_test::Browser;
using velk_test::HeaderList;
using velk_test::JsonOf;
using velk_test::LogCapture;
using web::Response;

const char *const kLink = "/sharing/abc";
const HeaderList kJson = {{"Accept", "application/json"}};
const HeaderList kApi = {{"Accept", "application/json"}, {"X-Velk-Sharing", ""}};

class SiteJson : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (!IsSkipped()) StoreWithPassword("abc");
  }

  void ExpectResult(Response response, int status, int code, const char *name) {
    EXPECT_EQ(status, response.status);
    const Json::Value document = JsonOf(response);
    EXPECT_EQ(code, document["code"].asInt());
    EXPECT_EQ(name, document["name"].asString());
  }

  /// The identifier of a session that is in.
  std::string LoggedIn() {
    Browser client(site());
    client.Post(kLink, {{"password", "secret"}}, kApi);
    return client.CookieFor(kLink, "sharing_sid");
  }
};

TEST_F(SiteJson, ALoginIsAskedFor) {
  ExpectResult(Browser(site()).Get(kLink, kJson), 401, -5, "VELK_SHARING_AUTH_NO_SESSION");
}

TEST_F(SiteJson, ALoginWorks) {
  Browser client(site());
  ExpectResult(client.Post(kLink, {{"password", "secret"}}, kApi), 200, 1, "VELK_SHARING_LOGIN_OK");
  EXPECT_EQ(32u, client.CookieFor(kLink, "sharing_sid").size());
}

TEST_F(SiteJson, EachRefusalHasItsCode) {
  const LogCapture quiet;
  Browser client(site());
  ExpectResult(client.Post(kLink, {{"password", "wrong"}}, kApi), 401, -9,
               "VELK_SHARING_LOGIN_WRONG_PASSWORD");
  ExpectResult(client.Post(kLink, {}, kApi), 401, -3, "VELK_SHARING_LOGIN_REFUSED");
  ExpectResult(client.Post("/sharing/unknown", {}, kApi), 404, -3, "VELK_SHARING_LOGIN_REFUSED");
  ExpectResult(client.Get("/sharing/unknown", kJson), 404, -7, "VELK_SHARING_AUTH_NO_GRANT");
  ExpectResult(client.Post(kLink, {{"password", "secret"}}, kJson), 403, 0, "FORBIDDEN");
  ExpectResult(client.Post("/sharing/abc/sub", {}, kApi), 405, 0, "METHOD_NOT_ALLOWED");
}

TEST_F(SiteJson, TheSessionMayComeInAHeader) {
  Browser client(site());
  Response response =
      client.Get(kLink, {{"Accept", "application/json"}, {"X-Velk-Sharing", LoggedIn()}});
  ExpectResult(std::move(response), 200, 1, "VELK_SHARING_AUTH_OK");
  EXPECT_EQ("", client.CookieFor(kLink, "sharing_sid"));
}

TEST_F(SiteJson, TheHeadersNameIsTakenExactly) {
  const std::string session = LoggedIn();
  for (const char *name : {"X_Velk_Sharing", "X-Velk_Sharing", "X-Velk-Sharing2", "Velk-Sharing"})
    EXPECT_EQ(401, Browser(site()).Get(kLink, {kJson[0], {name, session}}).status) << name;
}

TEST_F(SiteJson, AFolderIsListed) {
  Response response = Browser(site()).Get(kLink, {kJson[0], {"X-Velk-Sharing", LoggedIn()}});
  const Json::Value document = JsonOf(response);
  EXPECT_EQ("folder", document["type"].asString());
  ASSERT_EQ(4u, document["entries"].size());
  EXPECT_EQ("sub", document["entries"][0]["name"].asString());
  EXPECT_EQ("folder", document["entries"][0]["type"].asString());
  const Json::Value &file = document["entries"][1];
  EXPECT_EQ("hello.txt", file["name"].asString());
  EXPECT_EQ("/sharing/abc/hello.txt", file["address"].asString());
  EXPECT_EQ(15, file["size"].asInt());
  EXPECT_LT(0, file["modified"].asInt64());
}

TEST_F(SiteJson, AnAddressOfAListingLeadsToItsFile) {
  const std::string session = LoggedIn();
  Response listing = Browser(site()).Get(kLink, {kJson[0], {"X-Velk-Sharing", session}});
  for (const Json::Value &entry : JsonOf(listing)["entries"]) {
    Response file =
        Browser(site()).Get(entry["address"].asString(), {kJson[0], {"X-Velk-Sharing", session}});
    EXPECT_EQ(entry["type"].asString(), JsonOf(file)["type"].asString());
  }
}

TEST_F(SiteJson, ANameThatIsNotUtf8DoesNoHarm) {
  velk_test::WriteFile(Shared("latin\xe4.txt"), "x");
  Response response = Browser(site()).Get(kLink, {kJson[0], {"X-Velk-Sharing", LoggedIn()}});
  EXPECT_EQ(5u, JsonOf(response)["entries"].size());
}

TEST_F(SiteJson, AFileIsDownloadedAllTheSame) {
  Response response = Browser(site()).Get("/sharing/abc/hello.txt?download",
                                          {kJson[0], {"X-Velk-Sharing", LoggedIn()}});
  EXPECT_EQ("Hello, visitor\n", velk_test::BodyOf(response));
}

TEST_F(SiteJson, ALogoutWorksOnce) {
  const std::string session = LoggedIn();
  const HeaderList api = {kJson[0], {"X-Velk-Sharing", session}};
  ExpectResult(Browser(site()).Post("/sharing/abc/logout", {}, api), 200, 1, "OK");
  ExpectResult(Browser(site()).Post("/sharing/abc/logout", {}, api), 401, 0, "FAILED");
}

TEST_F(SiteJson, AnOpenLinkIsListedAtOnce) {
  StoreOpen("open");
  ExpectResult(Browser(site()).Get("/sharing/open", kJson), 200, 1, "VELK_SHARING_AUTH_OK");
}

}  // namespace
