// Why a visitor is refused, told without touching anything.

#include <unistd.h>

#include <ctime>

#include "integration/cli_support.h"
#include "velk_paths.h"

namespace {

using testing::HasSubstr;
using testing::StartsWith;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::ReadFile;
using velk_test::SharingDatabasePath;

constexpr char kBlocks[] = VELK_ROOT "/etc/private/autoblock.db";

class CliWhy : public velk_test::CommandLine {
 protected:
  struct Answer {
    int status;
    std::string text;
  };

  static Answer Why(const std::string &hash, const Arguments &options = {}) {
    Arguments arguments = {"link", "why", hash};
    arguments.insert(arguments.end(), options.begin(), options.end());
    const Outcome outcome = Run(arguments);
    EXPECT_EQ("", outcome.err);
    return {outcome.status, outcome.out};
  }

  static void ExpectRefused(const Answer &answer, const std::string &reason) {
    EXPECT_EQ(1, answer.status);
    EXPECT_THAT(answer.text, StartsWith("Refused: "));
    EXPECT_THAT(answer.text, HasSubstr(reason));
  }

  static void ExpectLetIn(const Answer &answer, const std::string &how) {
    EXPECT_EQ(0, answer.status);
    EXPECT_THAT(answer.text, StartsWith("Let in"));
    EXPECT_THAT(answer.text, HasSubstr(how));
  }

  static void RunSql(const std::string &sql) { RawDatabase(SharingDatabasePath()).Run(sql); }
};

TEST_F(CliWhy, TellsWhatALoginNeeds) {
  ExpectLetIn(Why(MakeLink()), "open to everybody");
  ExpectLetIn(Why(MakeLink({"--password-stdin"}, "x")), "password");
  ExpectLetIn(Why(MakeLink({"--user", "daemon"})), "permitted account");
}

TEST_F(CliWhy, UnknownLink) {
  MakeLink();
  ExpectRefused(Why("nosuch"), "there is no link “nosuch”");
}

TEST_F(CliWhy, DamagedLink) {
  const std::string hash = MakeLink();
  Damage(hash);
  ExpectRefused(Why(hash), "damaged");
}

TEST_F(CliWhy, DisabledLink) {
  const std::string hash = MakeLink();
  Run({"link", "disable", hash});
  ExpectRefused(Why(hash), "disabled");
}

TEST_F(CliWhy, LinkThatHasNotStarted) {
  ExpectRefused(Why(MakeLink({"--start", "2099-01-02 03:04:05"})),
                "has not started; it does at 2099-01-02 03:04:05");
}

TEST_F(CliWhy, ExpiredLink) {
  ExpectRefused(Why(MakeLink({"--expire", "2020-01-02 03:04:05"})),
                "expired at 2020-01-02 03:04:05");
}

TEST_F(CliWhy, UsedUpForALoginButNotForWhoIsIn) {
  const std::string hash = MakeLink({"--uses", "1"});
  const std::string session = LogIn(hash);
  ExpectRefused(Why(hash), "used up: 1 of 1");
  ExpectLetIn(Why(hash, {"--session", session}), "logged in");
  RunSql("UPDATE entry SET use_count = 2");
  ExpectRefused(Why(hash, {"--session", session}), "used up: 2 of 1");
}

TEST_F(CliWhy, BlockedAddress) {
  const std::string hash = MakeLink();
  Run({"block", "add", "192.0.2.7"});
  ExpectRefused(Why(hash, {"--ip", "::ffff:192.0.2.7"}), "address 192.0.2.7 is blocked");
  ExpectLetIn(Why(hash, {"--ip", "192.0.2.8"}), "");
}

TEST_F(CliWhy, NobodyIsPermitted) {
  ExpectRefused(Why(MakeLink({"--user", "no such", "--allow-unknown"})), "knew none");
}

TEST_F(CliWhy, UnknownSession) {
  ExpectRefused(Why(MakeLink(), {"--session", "-nosuch"}), "no such session");
}

TEST_F(CliWhy, LapsedSessionAndGrant) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  RunSql("UPDATE token SET timeout = 1000000000");
  ExpectRefused(Why(hash, {"--session", session}), "grant on this link lapsed at 2001-09-");
  RunSql("UPDATE session SET timeout = 1000000000");
  ExpectRefused(Why(hash, {"--session", session}), "session lapsed at 2001-09-");
}

TEST_F(CliWhy, SessionWithoutAGrant) {
  const std::string session = LogIn(MakeLink());
  ExpectRefused(Why(MakeLink(), {"--session", session}), "has not logged in to this link");
}

TEST_F(CliWhy, SessionFromAnotherAddress) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash, {"--ip", "192.0.2.7"});
  ExpectRefused(Why(hash, {"--session", session, "--ip", "192.0.2.8"}),
                "belongs to address 192.0.2.7");
  ExpectLetIn(Why(hash, {"--session", session, "--ip", "192.0.2.7"}), "");
  Run({"link", "set", hash, "--no-match-ip"});
  ExpectLetIn(Why(hash, {"--session", session, "--ip", "192.0.2.8"}), "");
}

TEST_F(CliWhy, SessionWhoseAccountIsNotPermitted) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  Run({"link", "set", hash, "--group", "nogroup"});
  ExpectRefused(Why(hash, {"--session", session}), "asks for an account");
  RunSql("UPDATE session SET uid = 1");
  ExpectRefused(Why(hash, {"--session", session}), "account daemon is not permitted");
  RunSql("UPDATE session SET uid = 54321");
  ExpectRefused(Why(hash, {"--session", session}), "account 54321 does not exist");
  RunSql("UPDATE session SET uid = 65534");
  ExpectLetIn(Why(hash, {"--session", session}), "");
}

TEST_F(CliWhy, TheSessionMayStandInAFile) {
  const velk_test::TempDir folder;
  const std::string hash = MakeLink();
  velk_test::WriteFile(folder.File("session"), LogIn(hash) + "\n");
  ExpectLetIn(Why(hash, {"--session-file", folder.File("session")}), "");
}

TEST_F(CliWhy, AgreesWithTheAccessApiAboutSessions) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  for (const char *damage :
       {"SELECT 1", "UPDATE entry SET enabled = 0",
        "UPDATE entry SET enabled = 1, start_at = 4000000000",
        "UPDATE entry SET start_at = 0, expire_at = 1", "UPDATE entry SET expire_at = 0",
        "UPDATE entry SET expire_times = 3, use_count = 3", "UPDATE entry SET use_count = 4",
        "UPDATE entry SET expire_times = 0", "DELETE FROM token"}) {
    RunSql(damage);
    EXPECT_EQ(Why(hash, {"--session", session}).status,
              Run({"visit", "check", hash, "--session", session}).status)
        << damage;
  }
}

TEST_F(CliWhy, TellsMachinesAFixedReason) {
  const Outcome outcome = Run({"link", "why", MakeLink({"--expire", "@1000"}), "--json"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("\"reason\" : \"expired\""));
  EXPECT_THAT(outcome.out, HasSubstr("\"let_in\" : false"));
}

TEST_F(CliWhy, WritesNothing) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  Run({"block", "add", "192.0.2.7"});
  const std::string database = ReadFile(SharingDatabasePath());
  const std::string blocks = ReadFile(kBlocks);
  ASSERT_FALSE(database.empty());
  ASSERT_FALSE(blocks.empty());
  Why(hash, {"--ip", "192.0.2.7"});
  Why(hash, {"--ip", "192.0.2.8"});
  Why(hash, {"--session", session});
  EXPECT_TRUE(database == ReadFile(SharingDatabasePath()));
  EXPECT_TRUE(blocks == ReadFile(kBlocks));
}

TEST_F(CliWhy, MakesNeitherADatabaseNorABlockFile) {
  const Outcome outcome = Run({"link", "why", "aB3xK9pQ2", "--ip", "192.0.2.7"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("does not exist yet"));
  EXPECT_NE(0, access(SharingDatabasePath().c_str(), F_OK));
  EXPECT_NE(0, access(kBlocks, F_OK));
  Why(MakeLink(), {"--ip", "192.0.2.7"});
  EXPECT_NE(0, access(kBlocks, F_OK));
}

}  // namespace
