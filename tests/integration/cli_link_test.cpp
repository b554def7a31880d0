// Making, changing, listing and removing links from the command line.

#include <unistd.h>

#include <ctime>

#include "integration/cli_support.h"

namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::SharingDatabasePath;

class CliLink : public velk_test::CommandLine {
 protected:
  static std::vector<std::string> HashesOf(const Json::Value &list) {
    std::vector<std::string> hashes;
    for (const Json::Value &link : list["links"]) hashes.push_back(link["hash"].asString());
    return hashes;
  }

  static Json::Value Show(const std::string &hash) { return RunJson({"link", "show", hash}); }

  /// Status and message of a link that cannot be made so.
  static Outcome Refused(Arguments options) {
    options.insert(options.begin(), {"link", "create", "--project", "files"});
    const Outcome outcome = Run(options);
    EXPECT_EQ("", outcome.out);
    return outcome;
  }
};

TEST_F(CliLink, CreatePrintsTheHashAlone) {
  EXPECT_THAT(Run({"link", "create", "--project", "files"}).out,
              testing::MatchesRegex("[A-Za-z0-9]{9}\n"));
}

TEST_F(CliLink, ANewLinkIsOpenAndTheCallers) {
  const Json::Value link = RunJson({"link", "create", "--project", "files"});
  EXPECT_EQ("active", link["state"].asString());
  EXPECT_EQ("files", link["project_name"].asString());
  EXPECT_EQ(getuid(), link["owner_uid"].asUInt());
  EXPECT_EQ("none", link["protect_type"].asString());
  EXPECT_TRUE(link["enabled"].asBool());
  EXPECT_TRUE(link["auto_gc"].asBool());
  EXPECT_TRUE(link["enable_match_ip"].asBool());
  EXPECT_EQ(0, link["expire_at"].asInt64());
  EXPECT_EQ(Json::Value(Json::objectValue), link["app"]);
}

TEST_F(CliLink, EveryFieldCanBeSetAtOnce) {
  const std::string hash =
      MakeLink({"--owner",       "0",        "--title",        "Photos",         "--start",
                "@1000",         "--expire", "@4000000000",    "--uses",         "5",
                "--no-match-ip", "--keep",   "--redirect",     "always",         "--redirect-uri",
                "/photos",       "--app",    R"({"a":[1,2]})", "--private-data", R"({"b":null})"});
  const Json::Value link = Show(hash);
  EXPECT_EQ(0u, link["owner_uid"].asUInt());
  EXPECT_EQ("Photos", link["protect_title"].asString());
  EXPECT_EQ(1000, link["start_at"].asInt64());
  EXPECT_EQ(4000000000, link["expire_at"].asInt64());
  EXPECT_EQ(5, link["expire_times"].asInt());
  EXPECT_FALSE(link["enable_match_ip"].asBool());
  EXPECT_FALSE(link["auto_gc"].asBool());
  EXPECT_EQ("always", link["redirect_type"].asString());
  EXPECT_EQ("/photos", link["redirect_uri"].asString());
  EXPECT_EQ(2, link["app"]["a"][1].asInt());
  EXPECT_TRUE(link["private_data"].isMember("b"));
}

TEST_F(CliLink, PathIsShortForAnApp) {
  EXPECT_EQ("/srv/a b", Show(MakeLink({"--path", "/srv/a b"}))["app"]["path"].asString());
}

TEST_F(CliLink, WhatALinkGuardsStandsInItsApp) {
  const Json::Value app = Show(MakeLink({"--path", "/srv/a", "--protects", "https://wiki.example/",
                                         "--protects", "/photos/"}))["app"];
  EXPECT_EQ("/srv/a", app["path"].asString());
  ASSERT_EQ(2u, app["protects"].size());
  EXPECT_EQ("https://wiki.example/", app["protects"][0].asString());
  EXPECT_EQ("/photos/", app["protects"][1].asString());
}

TEST_F(CliLink, GuardingSomethingElseLeavesTheRestOfTheApp) {
  const std::string hash =
      MakeLink({"--app", R"({"path":"/srv/a","hide_download":true,"protects":["/old/"]})"});
  Run({"link", "set", hash, "--protects", "/new/"});
  Json::Value app = Show(hash)["app"];
  ASSERT_EQ(1u, app["protects"].size());
  EXPECT_EQ("/new/", app["protects"][0].asString());
  EXPECT_EQ("/srv/a", app["path"].asString());
  EXPECT_TRUE(app["hide_download"].asBool());
  Run({"link", "set", hash, "--no-protects"});
  app = Show(hash)["app"];
  EXPECT_FALSE(app.isMember("protects"));
  EXPECT_EQ("/srv/a", app["path"].asString());
}

TEST_F(CliLink, WhatNoLinkCanGuardIsRefused) {
  for (const char *prefix : {"", "wiki.example", "ftp://wiki.example/", "photos/", "//photos/",
                             "/photos/?x", "/a/../b", "https://ann@wiki.example/"}) {
    const Outcome outcome = Refused({"--protects", prefix});
    EXPECT_EQ(2, outcome.status) << prefix;
    EXPECT_THAT(outcome.err, HasSubstr(std::string("“") + prefix + "”"));
  }
}

TEST_F(CliLink, OptionsThatContradictEachOtherAreRefused) {
  EXPECT_EQ(2, Refused({"--path", "/a", "--app", "{}"}).status);
  EXPECT_EQ(2, Refused({"--protects", "/a/", "--app", "{}"}).status);
  EXPECT_EQ(2, Refused({"--match-ip", "--no-match-ip"}).status);
  EXPECT_EQ(2, Refused({"--keep", "--auto-remove"}).status);
  EXPECT_EQ(2, Refused({"--password-stdin", "--user", "daemon"}).status);
  EXPECT_EQ(2, Refused({"--password-stdin", "--password-file", "/dev/null"}).status);
  EXPECT_EQ(2, Refused({"--redirect-uri", "/a"}).status);
  EXPECT_EQ(2, Refused({"--redirect", "none", "--redirect-uri", "/a"}).status);
  EXPECT_EQ(2, Refused({"--redirect", "always"}).status);
  EXPECT_EQ(2, Refused({"--start", "@2000", "--expire", "@1000"}).status);
}

TEST_F(CliLink, AnEmptyProjectIsRefused) {
  EXPECT_EQ(2, Run({"link", "create", "--project", ""}).status);
}

TEST_F(CliLink, DocumentsAreParsedStrictly) {
  for (const char *text : {"", "[]", "1", "null", "{\"a\":1,}", "{} {}", "{'a':1}", "{\"a\":1",
                           "{\"a\":1,\"a\":2}", "// x\n{}", "{\"a\":NaN}"}) {
    EXPECT_EQ(2, Refused({"--app", text}).status) << text;
  }
}

TEST_F(CliLink, DocumentsMayNestFiveHundredDeep) {
  const auto nested = [](int depth) {
    return R"({"a":)" + std::string(depth - 1, '[') + std::string(depth - 1, ']') + "}";
  };
  const std::string hash = MakeLink({"--app", nested(500)});
  EXPECT_EQ("active", StateOf(hash));
  const Outcome outcome = Refused({"--app", nested(501)});
  EXPECT_EQ(2, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("500 levels"));
}

TEST_F(CliLink, PermittedNamesAreKeptAsIds) {
  const Json::Value link = Show(MakeLink({"--user", "daemon", "--group", "root"}));
  EXPECT_EQ("user", link["protect_type"].asString());
  EXPECT_EQ(1u, link["protect_uids"][0].asUInt());
  EXPECT_EQ(0u, link["protect_gids"][0].asUInt());
  EXPECT_EQ("daemon", link["protect_users"][0].asString());
  EXPECT_EQ("root", link["protect_groups"][0].asString());
}

TEST_F(CliLink, UnknownNamesAreRefusedAndNamed) {
  const Outcome outcome = Refused({"--user", "daemon", "--user", "no such", "--user", "nor this"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr("“no such”, “nor this”"), HasSubstr("never count")));
  EXPECT_EQ(1, Refused({"--group", "no such"}).status);
  EXPECT_EQ(0, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliLink, UnknownNamesCanBeKeptAsNames) {
  const Json::Value link = Show(MakeLink({"--user", "no such", "--allow-unknown"}));
  EXPECT_EQ("no such", link["protect_extra_users"][0].asString());
  EXPECT_EQ(0u, link["protect_uids"].size());
}

TEST_F(CliLink, ShowListsTheNamesThatNeverCount) {
  const std::string hash =
      MakeLink({"--user", "no such", "--group", "nor this", "--allow-unknown"});
  EXPECT_THAT(Run({"link", "show", hash}).out,
              HasSubstr("\nnever counted         no such, nor this\n"));
}

TEST_F(CliLink, AnUnknownOwnerIsRefused) {
  EXPECT_EQ(1, Refused({"--owner", "no such"}).status);
  EXPECT_EQ(1, Refused({"--owner", ""}).status);
  EXPECT_EQ(1, Refused({"--owner", "4294967295"}).status);
}

TEST_F(CliLink, SetChangesWhatIsNamedAndNothingElse) {
  const std::string hash = MakeLink({"--title", "old", "--uses", "3", "--expire", "@4000000000"});
  const Json::Value before = Show(hash);
  EXPECT_EQ(0, Run({"link", "set", hash, "--title", "new"}).status);
  Json::Value after = Show(hash);
  EXPECT_EQ("new", after["protect_title"].asString());
  after["protect_title"] = "old";
  EXPECT_EQ(before, after);
}

TEST_F(CliLink, SetTakesLimitsAway) {
  const std::string hash =
      MakeLink({"--uses", "3", "--start", "@1000", "--expire", "@4000000000", "--redirect",
                "url_param", "--redirect-uri", "/a", "--title", "x"});
  const Json::Value link = RunJson({"link", "set", hash, "--uses", "unlimited", "--start", "never",
                                    "--expire", "never", "--redirect", "none", "--title", ""});
  EXPECT_EQ(0, link["expire_times"].asInt());
  EXPECT_EQ(0, link["start_at"].asInt64());
  EXPECT_EQ(0, link["expire_at"].asInt64());
  EXPECT_EQ("none", link["redirect_type"].asString());
  EXPECT_EQ("", link["redirect_uri"].asString());
  EXPECT_EQ("", link["protect_title"].asString());
}

TEST_F(CliLink, OpenDropsThePasswordAndItsDigest) {
  const std::string hash = MakeLink({"--password-stdin"}, "secret\n");
  EXPECT_EQ(0, Run({"link", "set", hash, "--open"}).status);
  EXPECT_EQ("none", Show(hash)["protect_type"].asString());
  EXPECT_THAT(RawDatabase(SharingDatabasePath()).Value("SELECT data FROM entry"),
              HasSubstr("\"protect_password\":\"\""));
}

TEST_F(CliLink, APasswordReplacesPermittedAccounts) {
  const std::string hash = MakeLink({"--user", "daemon", "--group", "root"});
  const Json::Value link = RunJson({"link", "set", hash, "--password-stdin"}, "secret\n");
  EXPECT_EQ("password", link["protect_type"].asString());
  EXPECT_EQ(0u, link["protect_uids"].size());
  EXPECT_EQ(0u, link["protect_gids"].size());
}

TEST_F(CliLink, AccountsAndGroupsAreReplacedListByList) {
  const std::string hash = MakeLink({"--user", "daemon", "--group", "root"});
  EXPECT_EQ(0, Run({"link", "set", hash, "--no-users"}).status);
  EXPECT_EQ(0u, Show(hash)["protect_uids"].size());
  EXPECT_EQ(1u, Show(hash)["protect_gids"].size());
  EXPECT_EQ(2, Run({"link", "set", hash, "--no-groups"}).status) << "nobody would be permitted";
  EXPECT_EQ(1u, Show(hash)["protect_gids"].size());
}

TEST_F(CliLink, ALimitOnAnUnlimitedLinkCountsAnew) {
  const std::string hash = MakeLink();
  LogIn(hash);
  EXPECT_EQ(1, Show(hash)["use_count"].asInt());
  EXPECT_EQ(0, RunJson({"link", "set", hash, "--uses", "5"})["use_count"].asInt());
}

TEST_F(CliLink, NothingSecretIsShown) {
  const std::string hash = MakeLink({"--password-stdin"}, "secret\n");
  LogIn(hash, {"--password-stdin"}, "secret\n");
  RawDatabase raw(SharingDatabasePath());
  const std::string data = raw.Value("SELECT data FROM entry");
  const std::string digest =
      raw.Value("SELECT json_extract(data, '$.protect_password') FROM entry");
  const std::string salt =
      raw.Value("SELECT json_extract(data, '$.protect_password_salt') FROM entry");
  const std::string session = raw.Value("SELECT session_id FROM session");
  ASSERT_EQ(40u, digest.size());
  ASSERT_EQ(6u, salt.size());
  std::string shown;
  for (const Arguments &arguments :
       {Arguments{"link", "show", hash}, Arguments{"link", "list"}, Arguments{"session", "list"},
        Arguments{"token", "list"}, Arguments{"db", "status"}, Arguments{"db", "check"}}) {
    Arguments with_json = arguments;
    with_json.push_back("--json");
    shown += Run(arguments).out + Run(with_json).out;
  }
  EXPECT_THAT(shown, AllOf(HasSubstr(hash), Not(HasSubstr(digest)), Not(HasSubstr(salt)),
                           Not(HasSubstr(session))));
}

TEST_F(CliLink, EveryStateIsToldAndListed) {
  const std::string active = MakeLink();
  const std::string pending = MakeLink({"--start", "+1h"});
  const std::string expired = MakeLink({"--expire", "@" + std::to_string(time(nullptr) - 60)});
  const std::string used_up = MakeLink({"--uses", "1"});
  LogIn(used_up);
  const std::string disabled = MakeLink({"--expire", "@1000"});
  EXPECT_EQ(0, Run({"link", "disable", disabled}).status);
  for (const auto &[state, hash] : std::map<std::string, std::string>{{"active", active},
                                                                      {"pending", pending},
                                                                      {"expired", expired},
                                                                      {"used-up", used_up},
                                                                      {"disabled", disabled}}) {
    EXPECT_EQ(state, StateOf(hash));
    EXPECT_THAT(HashesOf(RunJson({"link", "list", "--state", state})), ElementsAre(hash));
  }
}

TEST_F(CliLink, ListFiltersByProjectAndOwner) {
  const std::string files = MakeLink({"--owner", "0"});
  Run({"link", "create", "--project", "it's", "--owner", "0"});
  const std::string other = MakeLink({"--owner", "12345"});
  EXPECT_THAT(HashesOf(RunJson({"link", "list", "--project", "files", "--owner", "0"})),
              ElementsAre(files));
  EXPECT_EQ(1, RunJson({"link", "list", "--project", "it's"})["total"].asInt());
  EXPECT_EQ(0, RunJson({"link", "list", "--project", "' OR 1 --"})["total"].asInt());
  EXPECT_THAT(HashesOf(RunJson({"link", "list", "--owner", "12345"})), ElementsAre(other));
}

TEST_F(CliLink, ListSortsAndPages) {
  std::vector<std::string> by_uses(4);
  for (const int uses : {3, 1, 4, 2})
    by_uses[uses - 1] = MakeLink({"--uses", std::to_string(uses)});
  EXPECT_EQ(by_uses, HashesOf(RunJson({"link", "list", "--sort", "uses"})));
  EXPECT_THAT(HashesOf(RunJson({"link", "list", "--sort", "uses", "--desc", "--limit", "1"})),
              ElementsAre(by_uses[3]));
  const Json::Value page =
      RunJson({"link", "list", "--sort", "uses", "--page", "2", "--page-size", "3"});
  EXPECT_THAT(HashesOf(page), ElementsAre(by_uses[3]));
  EXPECT_EQ(4, page["total"].asInt());
  EXPECT_EQ(3, page["offset"].asInt());
  EXPECT_THAT(
      HashesOf(RunJson({"link", "list", "--sort", "uses", "--offset", "1", "--limit", "2"})),
      ElementsAre(by_uses[1], by_uses[2]));
}

TEST_F(CliLink, ListGivesFiftyUnlessToldOtherwise) {
  MakeLink();
  RawDatabase(SharingDatabasePath())
      .Run(
          "WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n WHERE i < 59) "
          "INSERT INTO entry SELECT NULL, 'copy' || i, project_name, enabled, owner_uid, start_at, "
          "expire_at, expire_times, use_count, auto_gc, data FROM entry, n");
  const Json::Value list = RunJson({"link", "list"});
  EXPECT_EQ(50u, list["links"].size());
  EXPECT_EQ(60, list["total"].asInt());
}

TEST_F(CliLink, PagesThatCannotBeAreRefused) {
  for (const Arguments &options :
       {Arguments{"--page", "0"}, Arguments{"--page-size", "0"}, Arguments{"--limit", "-1"},
        Arguments{"--offset", "-1"}, Arguments{"--page", "2147483647", "--page-size", "100000"},
        Arguments{"--page", "1", "--limit", "5"}, Arguments{"--sort", "data"},
        Arguments{"--state", "odd"}}) {
    Arguments arguments = {"link", "list"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    EXPECT_EQ(2, Run(arguments).status) << testing::PrintToString(options);
  }
}

TEST_F(CliLink, EnableAndDisableTakeSeveralLinksAndReportTheUnknown) {
  const std::string first = MakeLink();
  const std::string second = MakeLink();
  const Outcome outcome = Run({"link", "disable", first, "unknown", second});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("“unknown”"));
  EXPECT_EQ("disabled", StateOf(first));
  EXPECT_EQ("disabled", StateOf(second));
  EXPECT_EQ(0, Run({"link", "enable", first, second}).status);
  EXPECT_EQ("active", StateOf(second));
}

TEST_F(CliLink, DeleteTakesTheGrantsAlong) {
  const std::string hash = MakeLink();
  LogIn(hash);
  const std::string other = MakeLink();
  LogIn(other);
  const Json::Value done = RunJson({"link", "delete", hash});
  EXPECT_EQ(1, done["done"][0]["tokens"].asInt());
  EXPECT_EQ(1, Run({"link", "show", hash}).status);
  EXPECT_EQ(1, RunJson({"token", "list"})["total"].asInt());
}

TEST_F(CliLink, DeleteOfAnUnknownLinkIsRefused) {
  MakeLink();
  EXPECT_EQ(1, Run({"link", "delete", "' OR 1 --"}).status);
  EXPECT_EQ(1, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliLink, PurgeRemovesExpiredAndUsedUpLinksOfOneOwner) {
  MakeLink({"--owner", "0", "--expire", "@1000", "--keep"});
  MakeLink({"--owner", "12345", "--expire", "@1000"});
  MakeLink({"--owner", "0"});
  const Json::Value removal = RunJson({"link", "purge", "--owner", "0"});
  EXPECT_EQ(3, removal["before"].asInt());
  EXPECT_EQ(1, removal["removed"].asInt());
  EXPECT_EQ(2, removal["after"].asInt());
}

TEST_F(CliLink, PurgeOfOneProjectLeavesTheOthers) {
  MakeLink({"--expire", "@1000"});
  Run({"link", "create", "--project", "other", "--expire", "@1000"});
  EXPECT_EQ(1, RunJson({"link", "purge", "--project", "other"})["removed"].asInt());
}

TEST_F(CliLink, AnEmptyFilterPurgesNothing) {
  MakeLink({"--expire", "@1000"});
  EXPECT_EQ(1, Run({"link", "purge", "--owner", ""}).status);
  EXPECT_EQ(2, Run({"link", "purge", "--project", ""}).status);
  EXPECT_EQ(1, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliLink, AnAutomaticPurgeSparesKeptLinks) {
  const std::string kept = MakeLink({"--expire", "@1000", "--keep"});
  MakeLink({"--expire", "@1000"});
  EXPECT_EQ(1, RunJson({"link", "purge", "--automatic"})["removed"].asInt());
  EXPECT_EQ("expired", StateOf(kept));
  EXPECT_EQ(1, RunJson({"link", "purge"})["removed"].asInt());
}

TEST_F(CliLink, DamagedRowsAreLeftOutAndMentioned) {
  const std::string damaged = MakeLink();
  const std::string sound = MakeLink();
  Damage(damaged);
  const Outcome outcome = Run({"link", "list"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, AllOf(HasSubstr(sound), Not(HasSubstr(damaged))));
  EXPECT_THAT(outcome.err, HasSubstr("1 link of this page cannot be loaded"));
}

TEST_F(CliLink, ADamagedLinkIsRefusedButCanBeDeleted) {
  const std::string hash = MakeLink();
  Damage(hash);
  const Outcome outcome = Run({"link", "show", hash});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("damaged"));
  EXPECT_EQ(1, Run({"link", "set", hash, "--title", "x"}).status);
  EXPECT_EQ(0, Run({"link", "delete", hash}).status);
  EXPECT_EQ(0, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliLink, AChangeLosesNoUseThatIsCountedAtTheSameTime) {
  const std::string hash = MakeLink();
  const std::vector<int> status = velk_test::RunForkedTogether(4, [&](int number) {
    for (int i = 0; i < 10; ++i) {
      const Outcome outcome =
          number == 0 ? Run({"visit", "login", hash}) : Run({"link", "set", hash, "--title", "t"});
      if (outcome.status != 0) return 1;
    }
    return 0;
  });
  EXPECT_THAT(status, testing::Each(0));
  EXPECT_EQ(10, Show(hash)["use_count"].asInt());
}

}  // namespace
