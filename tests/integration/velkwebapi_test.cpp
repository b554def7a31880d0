// The program that does one request of the web API, by its command line.

#include "integration/webapi_support.h"

#include <unistd.h>

#include <ctime>

#include "velk_paths.h"

namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using velk_test::IsError;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::RunProgram;
using velk_test::SharingDatabasePath;

class VelkWebApi : public velk_test::WebApi {
 protected:
  /// Makes a link with these parameters beside its project and owner.
  static Json::Value Create(Arguments parameters = {}, const std::string &input = "") {
    parameters.insert(parameters.end(), {"project_name=files", "owner=0"});
    return Data(kLink, "create", parameters, input);
  }

  static Json::Value CreateError(Arguments parameters, const std::string &input = "") {
    parameters.insert(parameters.end(), {"project_name=files", "owner=0"});
    return Error(kLink, "create", parameters, input);
  }

  static std::string HashOf(const Json::Value &link) { return link["hash"].asString(); }

  static Arguments Hash(const Json::Value &link) { return {"hash=" + HashOf(link)}; }

  static std::vector<std::string> HashesOf(const Json::Value &list) {
    std::vector<std::string> hashes;
    for (const Json::Value &link : list["items"]) hashes.push_back(HashOf(link));
    return hashes;
  }

  static bool Opens(const std::string &hash, const std::string &password) {
    return Run({"visit", "login", hash, "--password-stdin"}, password).status == 0;
  }

  /// The message for a command line that is no request.
  static std::string Misused(const Arguments &arguments) {
    const Outcome outcome = RunWebApi(arguments);
    EXPECT_EQ(2, outcome.status) << testing::PrintToString(arguments);
    EXPECT_EQ("", outcome.out);
    return outcome.err;
  }
};

const std::string kLinkApi = "api=VELK.Sharing.Link";

// --- The command line ---

TEST_F(VelkWebApi, ACommandLineThatIsNoRequestIsTold) {
  EXPECT_THAT(Misused({}), HasSubstr("--exec"));
  EXPECT_THAT(Misused({kLinkApi, "version=1", "method=list"}), HasSubstr("--exec"));
  EXPECT_THAT(Misused({"--exec"}), HasSubstr("api="));
  EXPECT_THAT(Misused({"--exec", "version=1", "method=list"}), HasSubstr("api="));
  EXPECT_THAT(Misused({"--exec", "api=", "version=1", "method=list"}), HasSubstr("api="));
  EXPECT_THAT(Misused({"--exec", kLinkApi, "method=list"}), HasSubstr("version="));
  EXPECT_THAT(Misused({"--exec", kLinkApi, "version=1"}), HasSubstr("method="));
  EXPECT_THAT(Misused({"--exec", kLinkApi, "version=1", "limit=1", "method=list"}),
              HasSubstr("method="));
  for (const char *version : {"version=one", "version=1.0", "version=-", "version= 1"}) {
    EXPECT_THAT(Misused({"--exec", kLinkApi, version, "method=list"}), HasSubstr("whole number"));
  }
  EXPECT_THAT(Misused({"--exec", kLinkApi, "version=1", "method=list", "=1"}),
              HasSubstr("argument 5"));
}

TEST_F(VelkWebApi, AnArgumentThatIsNoPairIsNotRepeated) {
  const std::string message =
      Misused({"--exec", kLinkApi, "version=1", "method=list", "tops3cret"});
  EXPECT_THAT(message, AllOf(HasSubstr("argument 5"), Not(HasSubstr("tops3cret"))));
}

TEST_F(VelkWebApi, TellsHowItIsUsedAndItsVersion) {
  EXPECT_THAT(RunWebApi({"--help"}).out,
              AllOf(StartsWith("usage: "), HasSubstr("VELK.Sharing.Block"), HasSubstr("Example")));
  EXPECT_THAT(RunWebApi({"--version"}).out, StartsWith("velkwebapi 6."));
}

TEST_F(VelkWebApi, TheHeadingsMayStandInAnyOrder) {
  const Outcome outcome = RunWebApi({"--exec", "method=query", "version=1", "api=VELK.API.Info"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("\"success\":true"));
}

TEST_F(VelkWebApi, AParameterCannotTakeTheMethodsPlace) {
  const Json::Value link = Create();
  EXPECT_THAT(Error(kLink, "get", {"hash=" + HashOf(link), "method=delete"}),
              IsError(201, "“method”"));
  EXPECT_EQ(HashOf(link), HashOf(Data(kLink, "get", Hash(link))));
}

TEST_F(VelkWebApi, AFullOutputIsAnError) {
  const Outcome outcome = RunProgram(
      {"/bin/sh", "-c",
       "exec " VELK_ROOT "/bin/velkwebapi --exec api=VELK.API.Info version=1 method=query "
       ">/dev/full"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("could not be written"));
}

// --- What every method has in common ---

TEST_F(VelkWebApi, WhatDoesNotExistIsNamed) {
  EXPECT_THAT(Error("VELK.Sharing.Nothing", "list"), IsError(101, "“VELK.Sharing.Nothing”"));
  EXPECT_THAT(Error("velk.sharing.link", "list"), IsError(101, "“velk.sharing.link”"));
  EXPECT_THAT(Error(kLink, "remove"), IsError(103, "“remove”"));
  for (const char *version : {"0", "2", "-1", "01", "99999999999999999999"}) {
    const Outcome outcome =
        RunWebApi({"--exec", kLinkApi, "version=" + std::string(version), "method=list"});
    EXPECT_EQ(0, outcome.status);
    EXPECT_THAT(outcome.out, HasSubstr("\"code\":102")) << version;
  }
}

TEST_F(VelkWebApi, AParameterThatIsUnknownDoubleOrMissingIsNamed) {
  EXPECT_THAT(Error(kLink, "list", {"limits=1"}), IsError(201, "“limits”"));
  EXPECT_THAT(Error(kLink, "get", {"hash=a", "hash=a"}), IsError(202, "“hash”"));
  EXPECT_THAT(Error(kLink, "get"), IsError(203, "“hash”"));
  EXPECT_THAT(Error(kLink, "create", {"owner=0"}), IsError(203, "“project_name”"));
  EXPECT_THAT(Error(kLink, "create", {"project_name=files"}), IsError(203, "“owner”"));
}

TEST_F(VelkWebApi, ABadValueIsToldWithItsParameter) {
  const auto bad = [](const std::string &name, const std::vector<std::string> &values) {
    for (const std::string &value : values) {
      EXPECT_THAT(CreateError({name + "=" + value}), IsError(204, "“" + name + "”: ")) << value;
    }
  };
  bad("expire_times", {"", "-1", "+1", "1.5", "0x1", "1 ", "2147483648", "many"});
  bad("start_at", {"-1", "253402300800", "99999999999999999999", "2026-12-31"});
  bad("enabled", {"", "yes", "True", "2"});
  bad("protect_type", {"", "open", "None"});
  bad("redirect_type", {"", "sometimes"});
  bad("app", {"", "[]", "1", "null", "{", "{\"a\":1,}", "{\"a\":1,\"a\":2}", "{} {}"});
  bad("protect_users", {"", "daemon", "{}", "[1]", "[\"daemon\",null]", "[[\"daemon\"]]"});
  bad("password_fd", {"", "-1", "2147483648", "999", "stdin"});
  EXPECT_THAT(Error(kLink, "why", {"hash=a", "ip=here"}), IsError(204, "“ip”: "));
  EXPECT_THAT(Error(kBlock, "add", {"address=1.2.3.4/24"}), IsError(204, "“address”: "));
  EXPECT_EQ(0, Data(kLink, "list")["total"].asInt());
}

TEST_F(VelkWebApi, AnAccountThatDoesNotExistIsNamed) {
  EXPECT_THAT(Error(kLink, "create", {"project_name=a", "owner=no such"}),
              IsError(301, "“owner”: there is no account “no such”"));
  EXPECT_THAT(Error(kLink, "list", {"owner=4294967295"}), IsError(301, "“owner”"));
}

TEST_F(VelkWebApi, BytesThatAreNoTextStillGiveOneDocument) {
  for (const std::string &bytes :
       {std::string("\xff\xfe"), std::string("\xc3"), std::string("\xed\xa0\x80"),
        std::string("\xf8\x88\x80\x80\x80"), std::string("\xc0\xaf"),
        std::string("\xf4\xbf\xbf\xbf"), std::string("\"\\\n\x01\x7f\x80")}) {
    const Json::Value link = Create({"protect_title=" + bytes, "app={\"a\":1}"});
    EXPECT_THAT(HashesOf(Data(kLink, "list", {"limit=1", "sort_by=id", "sort_direction=desc"})),
                ElementsAre(HashOf(link)));
    Error(kLink, "get", {"hash=" + bytes});
    Error(kLink, "get", {bytes + "=1"});
    Error(bytes, "get");
    Error(kLink, bytes);
  }
}

TEST_F(VelkWebApi, AnUnusableDatabaseIsTold) {
  velk_test::WriteFile(SharingDatabasePath(), std::string(8192, 'x'));
  EXPECT_THAT(Error(kLink, "list"), IsError(401, "it is not an SQLite database"));
  EXPECT_THAT(Error(kLink, "why", {"hash=a"}), IsError(401, SharingDatabasePath()));
}

TEST_F(VelkWebApi, AnotherUserIsToldWhoMayUseIt) {
  if (geteuid() != 0) GTEST_SKIP() << "needs root to become somebody else";
  Create();
  const Outcome outcome =
      RunProgram({"setpriv", "--reuid=65534", "--regid=65534", "--clear-groups",
                  VELK_ROOT "/bin/velkwebapi", "--exec", kLinkApi, "version=1", "method=list"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, AllOf(HasSubstr("\"code\":401"), HasSubstr("only root")));
}

// --- Links ---

TEST_F(VelkWebApi, ANewLinkIsOpenAndWithoutLimits) {
  const Json::Value link = Create();
  EXPECT_THAT(HashOf(link), testing::MatchesRegex("[A-Za-z0-9]{9}"));
  EXPECT_EQ("active", link["state"].asString());
  EXPECT_EQ("none", link["protect_type"].asString());
  EXPECT_TRUE(link["enabled"].asBool());
  EXPECT_TRUE(link["auto_gc"].asBool());
  EXPECT_TRUE(link["enable_match_ip"].asBool());
  EXPECT_EQ(Json::Value(Json::objectValue), link["app"]);
}

TEST_F(VelkWebApi, EveryFieldCanBeGivenAtOnce) {
  const Json::Value link =
      Create({"enabled=false", "start_at=1000", "expire_at=4000000000", "expire_times=5",
              "auto_gc=0", "enable_match_ip=false", "protect_title=a = b",
              "protect_users=[\"daemon\"]", "protect_groups=[\"root\"]", "redirect_type=always",
              "redirect_uri=/p?a=b", "app={\"a\":[1,2]}", "private_data={\"b\":null}"});
  EXPECT_FALSE(link["enabled"].asBool());
  EXPECT_EQ(1000, link["start_at"].asInt64());
  EXPECT_EQ(4000000000, link["expire_at"].asInt64());
  EXPECT_EQ(5, link["expire_times"].asInt());
  EXPECT_FALSE(link["auto_gc"].asBool());
  EXPECT_FALSE(link["enable_match_ip"].asBool());
  EXPECT_EQ("a = b", link["protect_title"].asString());
  EXPECT_EQ("user", link["protect_type"].asString());
  EXPECT_EQ("daemon", link["protect_users"][0].asString());
  EXPECT_EQ(0u, link["protect_gids"][0].asUInt());
  EXPECT_EQ("always", link["redirect_type"].asString());
  EXPECT_EQ("/p?a=b", link["redirect_uri"].asString());
  EXPECT_EQ(2, link["app"]["a"][1].asInt());
  EXPECT_TRUE(link["private_data"].isMember("b"));
  EXPECT_EQ(link, RunJson({"link", "show", HashOf(link)}));
}

TEST_F(VelkWebApi, TheRuleThatForbidsALinkIsTold) {
  EXPECT_THAT(Error(kLink, "create", {"project_name=", "owner=0"}),
              IsError(302, "project must not be empty"));
  EXPECT_THAT(CreateError({"start_at=10", "expire_at=5"}), IsError(302, "end before it starts"));
  EXPECT_THAT(CreateError({"redirect_type=always"}), IsError(302, "needs a target"));
  EXPECT_THAT(CreateError({"redirect_uri=/a"}), IsError(302, "needs a kind of redirect"));
  EXPECT_THAT(CreateError({"protect_users=[]"}), IsError(302, "must permit"));
  EXPECT_THAT(CreateError({"password_fd=0", "protect_users=[\"daemon\"]"}, "secret\n"),
              IsError(302, "choose one"));
  EXPECT_THAT(CreateError({"password_fd=0", "protect_type=none"}, "secret\n"),
              IsError(302, "choose one"));
  EXPECT_THAT(CreateError({"password_fd=0"}, "\n"), IsError(302, "password is empty"));
  EXPECT_THAT(CreateError({"protect_users=[\"no such\"]"}), IsError(301, "“no such”"));
  EXPECT_EQ(0, Data(kLink, "list")["total"].asInt());
}

TEST_F(VelkWebApi, AKindOfProtectionNeedsWhatItStandsFor) {
  EXPECT_THAT(CreateError({"protect_type=password"}), IsError(203, "“password_fd”"));
  EXPECT_THAT(CreateError({"protect_type=user"}), IsError(203, "“protect_users”"));
  EXPECT_EQ(
      "password",
      Create({"protect_type=password", "password_fd=0"}, "secret\n")["protect_type"].asString());
}

TEST_F(VelkWebApi, UnknownNamesMayBeKept) {
  const Json::Value link = Create({"protect_users=[\"no such\"]", "allow_unknown=true"});
  EXPECT_EQ("no such", link["protect_extra_users"][0].asString());
}

TEST_F(VelkWebApi, APasswordIsTheFirstLineOfADescriptor) {
  const std::string hash = HashOf(Create({"password_fd=0"}, "  s3cret ä\r\nmore\n"));
  EXPECT_TRUE(Opens(hash, "  s3cret ä"));
  EXPECT_FALSE(Opens(hash, "s3cret ä"));
}

TEST_F(VelkWebApi, AnyOpenDescriptorWillDo) {
  const Outcome outcome = RunProgram(
      {"/bin/sh", "-c",
       "printf secret | { exec 7<&0 </dev/null; exec " VELK_ROOT
       "/bin/velkwebapi --exec api=VELK.Sharing.Link version=1 method=create project_name=files "
       "owner=0 password_fd=7; }"});
  EXPECT_THAT(outcome.out, HasSubstr("\"success\":true"));
  const std::string hash = RawDatabase(SharingDatabasePath()).Value("SELECT hash FROM entry");
  EXPECT_TRUE(Opens(hash, "secret"));
}

TEST_F(VelkWebApi, ADescriptorWithoutAFitLineIsRefused) {
  EXPECT_THAT(CreateError({"password_fd=0"}, ""), IsError(204, "“password_fd”: there is no line"));
  EXPECT_THAT(CreateError({"password_fd=0"}, std::string(4097, 'x')),
              IsError(204, "“password_fd”: the secret is longer"));
  EXPECT_THAT(CreateError({"password_fd=1"}), IsError(204, "“password_fd”: "));
}

TEST_F(VelkWebApi, ARequestThatIsRefusedReadsNoDescriptor) {
  const Outcome outcome = RunProgram(
      {"/bin/sh", "-c",
       VELK_ROOT "/bin/velkwebapi --exec api=VELK.Sharing.Link version=1 method=create "
                 "project_name=files owner=0 expire_times=none password_fd=0 >/dev/null; cat"},
      "secret\n");
  EXPECT_EQ("secret\n", outcome.out);
}

TEST_F(VelkWebApi, NothingSecretComesOut) {
  const Json::Value link = Create({"password_fd=0"}, "tops3cret\n");
  const std::string session = LogIn(HashOf(link), {"--password-stdin"}, "tops3cret\n");
  RawDatabase raw(SharingDatabasePath());
  const std::string digest =
      raw.Value("SELECT json_extract(data, '$.protect_password') FROM entry");
  const std::string salt =
      raw.Value("SELECT json_extract(data, '$.protect_password_salt') FROM entry");
  ASSERT_EQ(40u, digest.size());
  ASSERT_EQ(6u, salt.size());
  ASSERT_EQ(32u, session.size());
  std::string shown = link.toStyledString();
  shown += Data(kLink, "get", Hash(link)).toStyledString();
  shown += Data(kLink, "list").toStyledString();
  shown += Data(kLink, "set", Hash(link)).toStyledString();
  shown += Data(kLink, "why", {"hash=" + HashOf(link), "session_fd=0"}, session).toStyledString();
  shown += Data(kSession, "list").toStyledString();
  EXPECT_THAT(
      shown, AllOf(HasSubstr(session.substr(0, 4)), Not(HasSubstr(session)), Not(HasSubstr(digest)),
                   Not(HasSubstr(salt)), Not(HasSubstr("tops3cret"))));
}

TEST_F(VelkWebApi, SetChangesWhatIsGivenAndNothingElse) {
  const Json::Value link = Create({"protect_title=old", "expire_times=3", "app={\"a\":1}"});
  Json::Value changed = Data(kLink, "set", {"hash=" + HashOf(link), "protect_title=new"});
  EXPECT_EQ("new", changed["protect_title"].asString());
  changed["protect_title"] = "old";
  EXPECT_EQ(link, changed);
}

TEST_F(VelkWebApi, SetTakesLimitsAndProtectionAway) {
  const Json::Value link =
      Create({"password_fd=0", "expire_times=3", "start_at=1000", "expire_at=4000000000",
              "redirect_type=always", "redirect_uri=/a"},
             "secret\n");
  const Json::Value open =
      Data(kLink, "set",
           {"hash=" + HashOf(link), "protect_type=none", "expire_times=0", "start_at=0",
            "expire_at=0", "redirect_type=none", "protect_title="});
  EXPECT_EQ("none", open["protect_type"].asString());
  EXPECT_EQ(0, open["expire_times"].asInt());
  EXPECT_EQ(0, open["start_at"].asInt());
  EXPECT_EQ(0, open["expire_at"].asInt());
  EXPECT_EQ("", open["redirect_uri"].asString());
  EXPECT_EQ(0, Run({"visit", "login", HashOf(link)}).status);
}

TEST_F(VelkWebApi, AChangeThatIsRefusedChangesNothing) {
  const Json::Value link = Create({"start_at=1000"});
  EXPECT_THAT(Error(kLink, "set", {"hash=" + HashOf(link), "protect_title=x", "expire_at=5"}),
              IsError(302, "end before it starts"));
  EXPECT_EQ(link, Data(kLink, "get", Hash(link)));
}

TEST_F(VelkWebApi, AnUnknownLinkIsNotFound) {
  for (const char *method : {"get", "set", "delete", "url"})
    EXPECT_THAT(Error(kLink, method, {"hash=' OR 1 --"}), IsError(301, "“' OR 1 --”")) << method;
}

TEST_F(VelkWebApi, ADamagedLinkIsRefusedButCanBeDeleted) {
  const Json::Value link = Create();
  Damage(HashOf(link));
  EXPECT_THAT(Error(kLink, "get", Hash(link)), IsError(302, "damaged"));
  EXPECT_EQ(1, Data(kLink, "list")["damaged"].asInt());
  EXPECT_EQ(HashOf(link), HashOf(Data(kLink, "delete", Hash(link))));
  EXPECT_EQ(0, Data(kLink, "list")["total"].asInt());
}

TEST_F(VelkWebApi, DeleteTellsTheGrantsThatAreGone) {
  const Json::Value link = Create();
  LogIn(HashOf(link));
  EXPECT_EQ(1, Data(kLink, "delete", Hash(link))["tokens"].asInt());
  EXPECT_EQ(0, RunJson({"token", "list"})["total"].asInt());
}

TEST_F(VelkWebApi, ListFiltersSortsAndPages) {
  std::vector<std::string> by_times(4);
  for (const int times : {3, 1, 4, 2})
    by_times[times - 1] = HashOf(Create({"expire_times=" + std::to_string(times)}));
  Data(kLink, "create", {"project_name=other", "owner=12345", "enabled=false"});
  EXPECT_EQ(5, Data(kLink, "list")["total"].asInt());
  EXPECT_EQ(1, Data(kLink, "list", {"project=other"})["total"].asInt());
  EXPECT_EQ(0, Data(kLink, "list", {"project=' OR 1 --"})["total"].asInt());
  EXPECT_EQ(4, Data(kLink, "list", {"owner=0", "state=active"})["total"].asInt());
  EXPECT_EQ(1, Data(kLink, "list", {"owner=12345", "state=disabled"})["total"].asInt());
  const Json::Value page =
      Data(kLink, "list",
           {"owner=0", "sort_by=expire_times", "sort_direction=desc", "offset=1", "limit=2"});
  EXPECT_THAT(HashesOf(page), ElementsAre(by_times[2], by_times[1]));
  EXPECT_EQ(4, page["total"].asInt());
  EXPECT_EQ(1, page["offset"].asInt());
  EXPECT_EQ(2, page["limit"].asInt());
  EXPECT_EQ(0u, Data(kLink, "list", {"offset=2147483647"})["items"].size());
}

TEST_F(VelkWebApi, EveryOrderWorks) {
  Create();
  const Json::Value query = Data("VELK.API.Info", "query");
  for (const Json::Value &parameter : query["apis"][1]["methods"][0]["parameters"]) {
    if (parameter["name"] != "sort_by") continue;
    ASSERT_EQ(8u, parameter["choices"].size());
    for (const Json::Value &order : parameter["choices"])
      EXPECT_EQ(1u, Data(kLink, "list", {"sort_by=" + order.asString()})["items"].size());
  }
}

TEST_F(VelkWebApi, ListGivesAThousandAtMost) {
  Create();
  RawDatabase(SharingDatabasePath())
      .Run(
          "WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n WHERE i < 1000) "
          "INSERT INTO entry SELECT NULL, 'copy' || i, project_name, enabled, owner_uid, start_at, "
          "expire_at, expire_times, use_count, auto_gc, data FROM entry, n");
  EXPECT_EQ(50u, Data(kLink, "list")["items"].size());
  const Json::Value list = Data(kLink, "list", {"limit=1000"});
  EXPECT_EQ(1000u, list["items"].size());
  EXPECT_EQ(1001, list["total"].asInt());
  EXPECT_THAT(Error(kLink, "list", {"limit=1001"}), IsError(204, "“limit”"));
  EXPECT_THAT(Error(kLink, "list", {"limit=0"}), IsError(204, "“limit”"));
  EXPECT_THAT(Error(kLink, "list", {"offset=-1"}), IsError(204, "“offset”"));
}

TEST_F(VelkWebApi, PurgeRemovesWhatHasEnded) {
  Create({"expire_at=1000", "auto_gc=false"});
  Create({"expire_at=1000"});
  Data(kLink, "create", {"project_name=other", "owner=12345", "expire_at=1000"});
  Create();
  EXPECT_EQ(1, Data(kLink, "purge", {"project=other", "owner=12345"})["removed"].asInt());
  EXPECT_EQ(1, Data(kLink, "purge", {"automatic=true"})["removed"].asInt());
  const Json::Value rest = Data(kLink, "purge");
  EXPECT_EQ(2, rest["before"].asInt());
  EXPECT_EQ(1, rest["removed"].asInt());
  EXPECT_EQ(1, rest["after"].asInt());
}

TEST_F(VelkWebApi, AnEmptyFilterPurgesNothing) {
  Create({"expire_at=1000"});
  EXPECT_THAT(Error(kLink, "purge", {"project="}), IsError(302, "project"));
  EXPECT_THAT(Error(kLink, "purge", {"owner="}), IsError(301, "“owner”"));
  EXPECT_THAT(Error(kLink, "purge", {"automatic=true", "owner=0"}), IsError(204, "“automatic”"));
  EXPECT_EQ(1, Data(kLink, "list")["total"].asInt());
}

TEST_F(VelkWebApi, WhyJudgesALoginOrASession) {
  const Json::Value link = Create({"expire_times=1"});
  EXPECT_TRUE(Data(kLink, "why", Hash(link))["let_in"].asBool());
  const std::string session = LogIn(HashOf(link), {"--ip", "192.0.2.7"});
  EXPECT_EQ("used-up", Data(kLink, "why", Hash(link))["reason"].asString());
  EXPECT_EQ(
      "ok",
      Data(kLink, "why", {"hash=" + HashOf(link), "session_fd=0"}, session)["reason"].asString());
  EXPECT_EQ("other-address",
            Data(kLink, "why", {"hash=" + HashOf(link), "session_fd=0", "ip=192.0.2.8"},
                 session)["reason"]
                .asString());
  const Json::Value unknown = Data(kLink, "why", {"hash=unknown"});
  EXPECT_FALSE(unknown["let_in"].asBool());
  EXPECT_EQ("unknown-link", unknown["reason"].asString());
}

// --- Sessions and blocks ---

TEST_F(VelkWebApi, SessionsAreListedAndDeleted) {
  const Json::Value link = Create();
  LogIn(HashOf(link), {"--ip", "192.0.2.7"});
  LogIn(HashOf(link), {"--ip", "192.0.2.8"});
  EXPECT_EQ(2, Data(kSession, "list")["total"].asInt());
  const Json::Value list = Data(kSession, "list", {"ip=192.0.2.7", "limit=5"});
  ASSERT_EQ(1u, list["items"].size());
  EXPECT_EQ("192.0.2.7", list["items"][0]["ip"].asString());
  EXPECT_EQ("", list["items"][0]["account"].asString());
  EXPECT_GT(list["items"][0]["timeout"].asInt64(), time(nullptr));
  EXPECT_EQ(0, Data(kSession, "list", {"account=root"})["total"].asInt());
  const std::string id = "id=" + list["items"][0]["id"].asString();
  EXPECT_EQ(list["items"][0]["id"], Data(kSession, "delete", {id})["id"]);
  EXPECT_THAT(Error(kSession, "delete", {id}), IsError(301, "no session"));
  EXPECT_THAT(Error(kSession, "delete", {"id=0"}), IsError(204, "“id”"));
  EXPECT_EQ(1, Data(kSession, "list")["total"].asInt());
}

TEST_F(VelkWebApi, AddressesAreBlockedListedAndForgotten) {
  EXPECT_EQ("192.0.2.7", Data(kBlock, "add", {"address=::ffff:192.0.2.7"})["address"].asString());
  EXPECT_EQ("2001:db8:0:1::/64",
            Data(kBlock, "add", {"address=2001:db8:0:1::5", "seconds=60"})["address"].asString());
  const Json::Value list = Data(kBlock, "list");
  EXPECT_EQ(2, list["total"].asInt());
  for (const Json::Value &block : list["items"]) {
    const bool for_ever = block["address"] == "192.0.2.7";
    EXPECT_EQ(for_ever, block["blocked_until"].asInt64() == 0) << block;
  }
  EXPECT_EQ("192.0.2.7", Data(kBlock, "remove", {"address=192.0.2.7"})["address"].asString());
  EXPECT_THAT(Error(kBlock, "remove", {"address=192.0.2.7"}), IsError(301, "192.0.2.7"));
  Data(kBlock, "remove", {"address=2001:db8:0:1::/64"});
  EXPECT_EQ(0, Data(kBlock, "list")["total"].asInt());
  EXPECT_THAT(Error(kBlock, "add", {"address=192.0.2.7", "seconds=-1"}), IsError(204, "“seconds”"));
}

TEST_F(VelkWebApi, FailingAddressesAreListedOnRequest) {
  const Json::Value link = Create({"password_fd=0"}, "secret\n");
  EXPECT_FALSE(Opens(HashOf(link), "wrong\n"));
  EXPECT_EQ(0, Data(kBlock, "list")["total"].asInt());
  EXPECT_EQ(1, Data(kBlock, "list", {"all=true"})["items"][0]["attempts"].asInt());
}

TEST_F(VelkWebApi, AnUnusableBlockFileIsAFailureOfTheSystem) {
  velk_test::WriteFile(VELK_ROOT "/etc/private/autoblock.db", std::string(8192, 'x'));
  EXPECT_THAT(Error(kBlock, "list"), IsError(402, "autoblock.db"));
}

}  // namespace
