// The library calls the platform's programs, which work through the library on the same database.

#include <json/writer.h>

#include <filesystem>

#include "integration/cli_support.h"
#include "velk_paths.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"
#include "velksharing/utils.h"

namespace {

using namespace VELK::sharing;
using VELK::sharing::db::BaseDB;
using VELK::sharing::db::EntryDB;
using VELK::sharing::record::Entry;

const std::string kConfig = VELK_ROOT "/etc/sharing-url.conf";
constexpr char kLink[] = "VELK.Sharing.Link";

/// The links, on a connection of the test's own.
class Connection {
 public:
  Connection() : db_(velk_test::SharingDatabasePath(), 0660), links_(db_) {}

  EntryDB *operator->() { return &links_; }

 private:
  BaseDB db_;
  EntryDB links_;
};

class ServicesRoundTrip : public velk_test::CommandLine {
 protected:
  void TearDown() override {
    CommandLine::TearDown();
    if (velk_test::OwnsVelkRoot()) std::filesystem::remove(kConfig);
  }

  static Json::Value Send(const std::string &method, const Json::Value &params) {
    Json::Value reply;
    EXPECT_TRUE(SendWebapi(reply, kLink, 1, method, params));
    return reply;
  }

  static Json::Value Sent(const std::string &method, const Json::Value &params) {
    const Json::Value reply = Send(method, params);
    EXPECT_TRUE(reply["success"].asBool()) << reply;
    return reply["data"];
  }

  static Json::Value Named(const std::string &hash) {
    Json::Value params;
    params[SZK_HASH] = hash;
    return params;
  }

  static Json::Value NewLink() {
    Json::Value params;
    params[SZK_PROJECT_NAME] = "it's a \"test\"; $HOME `x` ü";
    params["owner"] = 0;
    params[SZK_ENABLE_MATCH_IP] = false;
    params[SZK_EXPIRE_TIMES] = 3;
    params[SZK_EXPIRE_AT] = Json::Int64{4000000000};
    params[SZK_APP] = R"({"path": "/srv/a b", "list": [1, 2]})";
    return params;
  }
};

TEST_F(ServicesRoundTrip, ALinkThatTheWebApiMakesIsTheLibrarys) {
  const Json::Value made = Sent("create", NewLink());
  const std::string hash = made[SZK_HASH].asString();
  Entry link;
  ASSERT_TRUE(Connection()->GetByHash(hash, link));
  EXPECT_EQ("it's a \"test\"; $HOME `x` ü", link.get_project_name());
  EXPECT_EQ(0u, link.get_owner_uid());
  EXPECT_FALSE(link.get_enable_match_ip());
  EXPECT_EQ(3, link.get_expire_times());
  EXPECT_EQ(4000000000, link.get_expire_at());
  EXPECT_EQ("/srv/a b", link.get_app()["path"].asString());
  EXPECT_EQ(made, Sent("get", Named(hash)));
}

TEST_F(ServicesRoundTrip, AChangeOfTheLibrarysIsSeenByTheWebApi) {
  const std::string hash = Sent("create", NewLink())[SZK_HASH].asString();
  Connection links;
  Entry link;
  ASSERT_TRUE(links->GetByHash(hash, link));
  ASSERT_TRUE(links->Update(link.set_enabled(false).set_protect_title("closed")));
  const Json::Value seen = Sent("get", Named(hash));
  EXPECT_FALSE(seen[SZK_ENABLED_].asBool());
  EXPECT_EQ("closed", seen[SZK_PROTECT_TITLE].asString());
}

TEST_F(ServicesRoundTrip, AChangeThroughTheWebApiIsSeenByTheLibrary) {
  Json::Value params = NewLink();
  const std::string hash = Sent("create", params)[SZK_HASH].asString();
  Connection links;
  Entry link;
  ASSERT_TRUE(links->GetByHash(hash, link));
  params = Named(hash);
  params[SZK_ENABLED_] = false;
  params[SZK_PROTECT_USERS] = R"(["daemon"])";
  Sent("set", params);
  ASSERT_TRUE(links->GetByHash(hash, link));
  EXPECT_FALSE(link.get_enabled());
  EXPECT_EQ(Entry::PROTECT_USER, link.get_protect_type());
  EXPECT_THAT(link.get_protect_users(), testing::ElementsAre("daemon"));
}

TEST_F(ServicesRoundTrip, ALinkThatTheWebApiDeletesIsGone) {
  const std::string hash = Sent("create", NewLink())[SZK_HASH].asString();
  Connection links;
  Entry link;
  ASSERT_TRUE(links->GetByHash(hash, link));
  Sent("delete", Named(hash));
  EXPECT_FALSE(links->GetByHash(hash, link));
  EXPECT_EQ(301, Send("get", Named(hash))["error"]["code"].asInt());
}

TEST_F(ServicesRoundTrip, ARefusalIsAnAnswer) {
  Json::Value params = NewLink();
  params["expire_in"] = 5;
  const Json::Value reply = Send("create", params);
  EXPECT_FALSE(reply["success"].asBool());
  EXPECT_EQ(201, reply["error"]["code"].asInt());
}

TEST_F(ServicesRoundTrip, AParameterIsNoHeading) {
  const std::string hash = Sent("create", NewLink())[SZK_HASH].asString();
  Json::Value params = Named(hash);
  params["method"] = "delete";
  params["api"] = "VELK.API.Info";
  EXPECT_EQ(201, Send("get", params)["error"]["code"].asInt());
  EXPECT_EQ(hash, Sent("get", Named(hash))[SZK_HASH].asString());
}

TEST_F(ServicesRoundTrip, ATextThatIsNoUtf8StillComesBackAsAnAnswer) {
  const Json::Value reply = Send("get", Named("\xff\xc3(\xed\xa0\x80"));
  EXPECT_EQ(301, reply["error"]["code"].asInt());
}

TEST_F(ServicesRoundTrip, NoDescriptorOfTheCallersIsReadThroughTheService) {
  Json::Value params = NewLink();
  for (const char *descriptor : {"0", "3", "4", "5"}) {
    params["password_fd"] = descriptor;
    EXPECT_EQ(204, Send("create", params)["error"]["code"].asInt()) << descriptor;
  }
}

TEST_F(ServicesRoundTrip, DocumentsAsDeepAsTheyMayBeComeBack) {
  Json::Value params = NewLink();
  params[SZK_APP] = R"({"a":)" + std::string(499, '[') + std::string(499, ']') + "}";
  const std::string hash = Sent("create", params)[SZK_HASH].asString();
  EXPECT_EQ(1u, Sent("list", Json::objectValue)["items"].size());
  Entry link;
  EXPECT_TRUE(Connection()->GetByHash(hash, link));
}

TEST_F(ServicesRoundTrip, TheUrlOfALinkComesFromTheProgram) {
  velk_test::WriteFile(kConfig, "external_host = share.example.org\nhttps = yes\n");
  std::string url;
  _tag_SHARING_URL_TYPE type{};
  ASSERT_TRUE(GetSharingURL("aB3xK9pQ2", 0, false, "", url, type));
  EXPECT_EQ("https://share.example.org/sharing/aB3xK9pQ2", url);
  EXPECT_EQ(2, type);
  ASSERT_TRUE(GetSharingURL("a/b", 8443, true, "2001:db8::1", "/s", url, type));
  EXPECT_EQ("https://[2001:db8::1]:8443/s/a%2Fb", url);
  EXPECT_EQ(1, type);
}

TEST_F(ServicesRoundTrip, TheLongestUrlComesWhole) {
  const std::string before = "http://h/sharing/";
  const std::string hash(4094 - before.size(), 'a');
  std::string url;
  _tag_SHARING_URL_TYPE type{};
  ASSERT_TRUE(GetSharingURL(hash, 0, false, "h", "", url, type));
  EXPECT_EQ(before + hash, url);
  EXPECT_FALSE(GetSharingURL(hash + "a", 0, false, "h", "", url, type));
}

TEST_F(ServicesRoundTrip, TheWebApiTellsTheSameUrl) {
  velk_test::WriteFile(kConfig, "external_host = share.example.org\n");
  const std::string hash = Sent("create", NewLink())[SZK_HASH].asString();
  const Json::Value answer = Sent("url", Named(hash));
  EXPECT_EQ("http://share.example.org/sharing/" + hash, answer["url"].asString());
  EXPECT_EQ(2, answer["type"].asInt());
  velk_test::WriteFile(kConfig, "nonsense\n");
  EXPECT_EQ(402, Send("url", Named(hash))["error"]["code"].asInt());
}

}  // namespace
