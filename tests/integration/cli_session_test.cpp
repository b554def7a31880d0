// Sessions, grants and blocked addresses from the command line.

#include <ctime>

#include "integration/cli_support.h"
#include "velk_paths.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::SharingDatabasePath;

constexpr char kBlockFile[] = VELK_ROOT "/etc/private/autoblock.db";

class CliSession : public velk_test::CommandLine {};
class CliToken : public velk_test::CommandLine {};
class CliBlock : public velk_test::CommandLine {};

void RunSql(const std::string &sql) {
  RawDatabase(SharingDatabasePath()).Run(sql);
}

TEST_F(CliSession, ListShowsTheBeginningOfTheIdentifierOnly) {
  const std::string session = LogIn(MakeLink(), {"--ip", "192.0.2.7"});
  const Outcome outcome = Run({"session", "list"});
  EXPECT_THAT(outcome.out, AllOf(HasSubstr(session.substr(0, 4) + "…"), HasSubstr("192.0.2.7"),
                                 Not(HasSubstr(session.substr(0, 5)))));
}

TEST_F(CliSession, ListFiltersByAccountAndAddress) {
  const std::string hash = MakeLink();
  LogIn(hash, {"--ip", "192.0.2.7"});
  LogIn(hash, {"--ip", "2001:db8::1"});
  RunSql("UPDATE session SET uid = 1 WHERE ip = '192.0.2.7'");
  EXPECT_EQ(2, RunJson({"session", "list"})["total"].asInt());
  EXPECT_EQ(1, RunJson({"session", "list", "--user", "daemon"})["total"].asInt());
  const Json::Value list = RunJson({"session", "list", "--ip", "2001:DB8:0::1"});
  ASSERT_EQ(1u, list["sessions"].size());
  EXPECT_EQ("2001:db8::1", list["sessions"][0]["ip"].asString());
  EXPECT_EQ("", list["sessions"][0]["account"].asString());
  EXPECT_NEAR(static_cast<double>(time(nullptr) + 86400), list["sessions"][0]["timeout"].asDouble(),
              60);
}

TEST_F(CliSession, LapsedOnesAreCountedAndPurged) {
  const std::string hash = MakeLink();
  LogIn(hash);
  LogIn(hash);
  RunSql("UPDATE session SET timeout = 1000 WHERE id = 1");
  const Json::Value list = RunJson({"session", "list"});
  EXPECT_EQ(1, list["total"].asInt());
  EXPECT_EQ(1, list["lapsed"].asInt());
  const Json::Value removal = RunJson({"session", "purge"});
  EXPECT_EQ(2, removal["before"].asInt());
  EXPECT_EQ(1, removal["removed"].asInt());
  EXPECT_EQ(1, removal["after"].asInt());
}

TEST_F(CliSession, DeleteLogsItsVisitorOut) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  const int id = RunJson({"session", "list"})["sessions"][0]["id"].asInt();
  EXPECT_EQ(0, Run({"session", "delete", std::to_string(id)}).status);
  EXPECT_THAT(Run({"visit", "check", hash, "--session", session}).out, HasSubstr("NO_SESSION"));
}

TEST_F(CliSession, DeleteReportsUnknownIdsAndDoesTheOthers) {
  LogIn(MakeLink());
  const Outcome outcome = Run({"session", "delete", "99", "1"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("there is no session 99"));
  EXPECT_EQ(0, RunJson({"session", "list"})["total"].asInt());
  EXPECT_EQ(2, Run({"session", "delete", "one"}).status);
}

TEST_F(CliToken, ListFiltersByLinkAndSession) {
  const std::string first = MakeLink();
  const std::string second = MakeLink();
  const std::string session = LogIn(first);
  LogIn(second, {"--session", session});
  LogIn(second);
  EXPECT_EQ(3, RunJson({"token", "list"})["total"].asInt());
  EXPECT_EQ(2, RunJson({"token", "list", "--link", second})["total"].asInt());
  EXPECT_EQ(2, RunJson({"token", "list", "--session", "1"})["total"].asInt());
  const Json::Value list = RunJson({"token", "list", "--link", first});
  EXPECT_EQ(first, list["tokens"][0]["hash"].asString());
  EXPECT_EQ(1, list["tokens"][0]["session_id"].asInt());
  EXPECT_EQ(1, Run({"token", "list", "--link", "nosuch"}).status);
}

TEST_F(CliToken, AGrantOnALinkThatIsGoneIsListed) {
  LogIn(MakeLink());
  RunSql("DELETE FROM entry");
  EXPECT_THAT(Run({"token", "list"}).out, HasSubstr("(deleted)"));
}

TEST_F(CliToken, DeleteTakesOneGrantAway) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  EXPECT_EQ(0, Run({"token", "delete", "1"}).status);
  EXPECT_EQ(1, Run({"token", "delete", "1"}).status);
  EXPECT_THAT(Run({"visit", "check", hash, "--session", session}).out, HasSubstr("NO_GRANT"));
}

TEST_F(CliToken, PurgeTellsWhatItRemoved) {
  const std::string hash = MakeLink();
  LogIn(hash);
  LogIn(hash);
  RunSql("UPDATE token SET timeout = 1000 WHERE id = 1");
  EXPECT_THAT(Run({"token", "purge"}).out, HasSubstr("removed 1 grant of 2; 1 left"));
}

TEST_F(CliBlock, AddBlocksForATimeOrForEver) {
  const long now = time(nullptr);
  EXPECT_EQ(0, Run({"block", "add", "192.0.2.7", "--for", "2h"}).status);
  EXPECT_EQ(0, Run({"block", "add", "2001:db8::5"}).status);
  const Json::Value list = RunJson({"block", "list"})["blocks"];
  ASSERT_EQ(2u, list.size());
  const Json::Value &limited = list[list[0]["address"].asString() == "192.0.2.7" ? 0 : 1];
  const Json::Value &endless = list[list[0]["address"].asString() == "192.0.2.7" ? 1 : 0];
  EXPECT_NEAR(static_cast<double>(now + 7200), limited["blocked_until"].asDouble(), 60);
  EXPECT_EQ("2001:db8::/64", endless["address"].asString());
  EXPECT_EQ(0, endless["blocked_until"].asInt64());
}

TEST_F(CliBlock, WhatIsNoAddressIsRefused) {
  const Outcome outcome = Run({"block", "add", "localhost", "192.0.2.7"});
  EXPECT_EQ(2, outcome.status);
  EXPECT_EQ(1u, RunJson({"block", "list"})["blocks"].size());
  EXPECT_EQ(2, Run({"block", "add", "192.0.2.8", "--for", "long"}).status);
}

TEST_F(CliBlock, RemoveLetsTheVisitorBackIn) {
  const std::string hash = MakeLink();
  Run({"block", "add", "192.0.2.7"});
  EXPECT_THAT(Run({"visit", "login", hash, "--ip", "192.0.2.7"}).out, HasSubstr("-8 BLOCKED"));
  EXPECT_EQ(0, Run({"block", "remove", "192.0.2.7"}).status);
  EXPECT_EQ(0, Run({"visit", "login", hash, "--ip", "192.0.2.7"}).status);
  EXPECT_EQ(1, Run({"block", "remove", "192.0.2.7"}).status) << "it is not remembered any more";
}

TEST_F(CliBlock, TakesAnAddressAsTheListPrintsIt) {
  Run({"block", "add", "2001:db8:0:1::5"});
  const std::string printed = RunJson({"block", "list"})["blocks"][0]["address"].asString();
  ASSERT_EQ("2001:db8:0:1::/64", printed);
  EXPECT_EQ(0, Run({"block", "add", printed, "--for", "2h"}).status);
  EXPECT_EQ(1u, RunJson({"block", "list"})["blocks"].size());
  EXPECT_EQ(0, Run({"block", "remove", printed}).status);
  EXPECT_EQ(0u, RunJson({"block", "list"})["blocks"].size());
  EXPECT_EQ(1, Run({"block", "remove", printed}).status) << "it is not remembered any more";
}

TEST_F(CliBlock, RemoveFindsTheNetworkOfAnAddress) {
  Run({"block", "add", "2001:db8:0:1::5", "192.0.2.7"});
  EXPECT_EQ(0, Run({"block", "remove", "2001:DB8:0:1::6"}).status);
  EXPECT_EQ(0, Run({"block", "remove", "::ffff:192.0.2.7"}).status);
  EXPECT_EQ(0u, RunJson({"block", "list"})["blocks"].size());
}

TEST_F(CliBlock, NoOtherNetworkIsTaken) {
  for (const char *network : {"192.0.2.7/64", "192.0.2.0/24", "2001:db8::/48", "/64", ""}) {
    EXPECT_EQ(2, Run({"block", "add", network}).status) << network;
    EXPECT_EQ(2, Run({"block", "remove", network}).status) << network;
  }
}

TEST_F(CliBlock, RemoveIsNotMisledByAnAddressThatFailsMeanwhile) {
  Run({"block", "add", "192.0.2.7"});
  RawDatabase(kBlockFile).Run(R"sql(
    CREATE TRIGGER meanwhile AFTER DELETE ON autoblock BEGIN
      INSERT INTO autoblock VALUES ('192.0.2.8', 'SHARING', 1, 1000, 1000, NULL);
    END)sql");
  const Outcome outcome = Run({"block", "remove", "192.0.2.7"});
  EXPECT_EQ(0, outcome.status) << outcome.err;
  const Json::Value all = RunJson({"block", "list", "--all"})["blocks"];
  ASSERT_EQ(1u, all.size());
  EXPECT_EQ("192.0.2.8", all[0]["address"].asString());
}

TEST_F(CliBlock, FailuresShowOnlyWhenAskedFor) {
  const std::string hash = MakeLink({"--password-stdin"}, "secret\n");
  Run({"visit", "login", hash, "--ip", "192.0.2.7", "--password-stdin"}, "wrong\n");
  EXPECT_EQ(0u, RunJson({"block", "list"})["blocks"].size());
  const Json::Value all = RunJson({"block", "list", "--all"})["blocks"];
  ASSERT_EQ(1u, all.size());
  EXPECT_EQ(1, all[0]["attempts"].asInt());
  EXPECT_EQ("SHARING", all[0]["category"].asString());
  EXPECT_FALSE(all[0]["blocked"].asBool());
}

TEST_F(CliBlock, AnUnusableBlockFileIsAnErrorOfTheSystem) {
  velk_test::WriteFile(kBlockFile, std::string(8192, 'x'));
  EXPECT_EQ(3, Run({"block", "list"}).status);
  EXPECT_EQ(3, Run({"block", "add", "192.0.2.7"}).status);
}

}  // namespace
