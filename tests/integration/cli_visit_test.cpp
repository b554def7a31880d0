// Visits through the access API, as the command line makes and names them.

#include "integration/cli_support.h"

namespace {

using testing::HasSubstr;
using testing::MatchesRegex;
using testing::StartsWith;
using velk_test::Outcome;
using velk_test::RawDatabase;
using velk_test::SharingDatabasePath;
using velk_test::TempDir;
using velk_test::WriteFile;

class CliVisit : public velk_test::CommandLine {
 protected:
  /// The first line of a visit: code and name.
  static std::string Result(const Arguments &arguments, const std::string &input = "",
                            const std::vector<std::string> &environment = {}) {
    Arguments command = arguments;
    command.insert(command.begin(), "visit");
    const Outcome outcome = Run(command, input, environment);
    EXPECT_EQ(outcome.out.starts_with("1 ") ? 0 : 1, outcome.status) << outcome.err;
    return outcome.out.substr(0, outcome.out.find(':'));
  }
};

TEST_F(CliVisit, LoginPrintsTheSession) {
  EXPECT_THAT(Run({"visit", "login", MakeLink()}).out,
              MatchesRegex("1 OK: logged in\nsession [-_A-Za-z0-9]{32}\n"));
}

TEST_F(CliVisit, LoginNamesEachRefusal) {
  const std::string secret = MakeLink({"--password-stdin"}, "secret\n");
  const std::string once = MakeLink({"--uses", "1"});
  LogIn(once);
  EXPECT_EQ("-3 REFUSED", Result({"login", "nosuch"}));
  EXPECT_EQ("-3 REFUSED", Result({"login", MakeLink({"--expire", "@1000"})}));
  EXPECT_EQ("-3 REFUSED", Result({"login", secret, "--no-password"}));
  EXPECT_EQ("-9 WRONG_PASSWORD", Result({"login", secret, "--password-stdin"}, "wrong\n"));
  EXPECT_EQ("-11 USED_UP", Result({"login", once}));
  Run({"block", "add", "192.0.2.7"});
  EXPECT_EQ("-8 BLOCKED", Result({"login", MakeLink(), "--ip", "192.0.2.7"}));
}

TEST_F(CliVisit, CheckNamesEachRefusal) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash, {"--ip", "192.0.2.7"});
  const Arguments check = {"check", hash, "--session", session, "--ip", "192.0.2.7"};
  EXPECT_EQ("1 OK", Result(check));
  EXPECT_EQ("-2 REFUSED", Result({"check", hash, "--session", session, "--ip", "192.0.2.8"}));
  EXPECT_EQ("-5 NO_SESSION", Result({"check", hash, "--session", "-x"}));
  EXPECT_EQ("-7 NO_GRANT", Result({"check", MakeLink(), "--session", session}));
  EXPECT_EQ("-7 NO_GRANT", Result({"check", "nosuch", "--session", session}));
  Run({"link", "disable", hash});
  EXPECT_EQ("-6 LINK_INVALID", Result(check));
}

TEST_F(CliVisit, LogoutTakesTheGrantAway) {
  const std::string hash = MakeLink();
  const std::string session = LogIn(hash);
  EXPECT_EQ("1 OK", Result({"logout", hash, "--session", session}));
  EXPECT_EQ("0 FAILED", Result({"logout", hash, "--session", session}));
  EXPECT_EQ("-7 NO_GRANT", Result({"check", hash, "--session", session}));
}

TEST_F(CliVisit, ASessionCanBePresentedInAFile) {
  const TempDir folder;
  const std::string hash = MakeLink();
  WriteFile(folder.File("session"), LogIn(hash) + "\n");
  EXPECT_EQ("1 OK", Result({"check", hash, "--session-file", folder.File("session")}));
  EXPECT_EQ("1 OK", Result({"logout", hash, "--session-file", folder.File("session")}));
}

TEST_F(CliVisit, ALoginKeepsTheSessionThatItPresents) {
  const std::string session = LogIn(MakeLink());
  EXPECT_EQ(session, LogIn(MakeLink(), {"--session", session}));
}

TEST_F(CliVisit, CheckAndLogoutNeedASession) {
  EXPECT_EQ(2, Run({"visit", "check", MakeLink()}).status);
  EXPECT_EQ(2, Run({"visit", "logout", MakeLink()}).status);
}

TEST_F(CliVisit, OnlyTheGivenAddressCounts) {
  const std::string hash = MakeLink();
  EXPECT_EQ("1 OK", Result({"login", hash}, "", {"REMOTE_ADDR=192.0.2.99", "REQUEST_METHOD=POST"}));
  EXPECT_EQ("127.0.0.1", RawDatabase(SharingDatabasePath()).Value("SELECT ip FROM session"));
  EXPECT_EQ(2, Run({"visit", "login", hash, "--ip", "nowhere"}).status);
}

TEST_F(CliVisit, TellsMachinesCodeNameAndSession) {
  const Json::Value result = RunJson({"visit", "login", MakeLink()});
  EXPECT_EQ(1, result["code"].asInt());
  EXPECT_EQ("OK", result["name"].asString());
  EXPECT_EQ(32u, result["session_id"].asString().size());
}

/// Links for accounts, with accounts that nss_wrapper and pam_wrapper play.
class CliAccountVisit : public CliVisit {
 protected:
  void SetUp() override {
    CliVisit::SetUp();
    if (IsSkipped()) return;
    WriteFile(folder.File("passwd"),
              "root:x:0:0::/:/bin/false\nann:x:70001:70001::/:/bin/false\n"
              "bob:x:70002:70002::/:/bin/false\n");
    WriteFile(folder.File("group"), "root:x:0:\nann:x:70001:\nteam:x:70009:bob\n");
    WriteFile(folder.File("accounts"), "ann:annpw:velk\nbob:bobpw:velk\n");
    const std::string module =
        PAM_WRAPPER_MODULES "/pam_matrix.so passdb=" + folder.File("accounts");
    WriteFile(folder.File("velk"),
              "auth required " + module + "\naccount required " + module + "\n");
  }

  std::vector<std::string> Accounts() const {
    return {"LD_PRELOAD=libnss_wrapper.so libpam_wrapper.so",
            "NSS_WRAPPER_PASSWD=" + folder.File("passwd"),
            "NSS_WRAPPER_GROUP=" + folder.File("group"), "PAM_WRAPPER=1",
            "PAM_WRAPPER_SERVICE_DIR=" + folder.path()};
  }

  std::string MakeAccountLink(const Arguments &who) const {
    Arguments arguments = {"link", "create", "--project", "files", "--owner", "0"};
    arguments.insert(arguments.end(), who.begin(), who.end());
    const Outcome outcome = Run(arguments, "", Accounts());
    EXPECT_EQ(0, outcome.status) << outcome.err;
    return outcome.out.substr(0, outcome.out.find('\n'));
  }

  std::string LogInAs(const std::string &hash, const std::string &user,
                      const std::string &password) const {
    return Result({"login", hash, "--as", user, "--password-stdin"}, password, Accounts());
  }

  TempDir folder;
};

TEST_F(CliAccountVisit, APermittedAccountIsLetIn) {
  EXPECT_EQ("1 OK", LogInAs(MakeAccountLink({"--user", "ann"}), "ann", "annpw\n"));
}

TEST_F(CliAccountVisit, AMemberOfAPermittedGroupIsLetIn) {
  EXPECT_EQ("1 OK", LogInAs(MakeAccountLink({"--group", "team"}), "bob", "bobpw\n"));
}

TEST_F(CliAccountVisit, OthersAreRefused) {
  const std::string hash = MakeAccountLink({"--user", "ann"});
  EXPECT_EQ("-2 ACCOUNT_REFUSED", LogInAs(hash, "ann", "wrong\n"));
  EXPECT_EQ("-10 NOT_PERMITTED", LogInAs(hash, "bob", "bobpw\n"));
  EXPECT_EQ("-3 REFUSED", Result({"login", hash, "--no-password"}, "", Accounts()));
}

TEST_F(CliAccountVisit, ANameIsAskedFor) {
  const Outcome outcome = Run({"visit", "login", MakeAccountLink({"--user", "ann"})});
  EXPECT_EQ(2, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("--as"));
}

TEST_F(CliAccountVisit, AKeptBlockStateCountsNoAccountThatIsNotPermitted) {
  const std::string hash = MakeAccountLink({"--user", "ann"});
  const Arguments visit = {"login", hash, "--as", "bob", "--password-stdin"};
  Arguments keeping = visit;
  keeping.push_back("--keep-block-state");
  EXPECT_EQ("-10 NOT_PERMITTED", Result(keeping, "bobpw\n", Accounts()));
  EXPECT_EQ(0u, RunJson({"block", "list", "--all"})["blocks"].size());
  EXPECT_EQ("-10 NOT_PERMITTED", Result(visit, "bobpw\n", Accounts()));
  EXPECT_EQ(1u, RunJson({"block", "list", "--all"})["blocks"].size());
}

TEST_F(CliAccountVisit, ASessionStaysItsAccounts) {
  const std::string hash = MakeAccountLink({"--user", "ann"});
  const Outcome login =
      Run({"visit", "login", hash, "--as", "ann", "--password-stdin"}, "annpw\n", Accounts());
  const std::string session = login.out.substr(login.out.find("session ") + 8, 32);
  EXPECT_EQ("1 OK", Result({"check", hash, "--session", session}, "", Accounts()));
  EXPECT_EQ("-2 REFUSED",
            Result({"check", hash, "--session", session, "--as", "ann", "--password-stdin"},
                   "wrong\n", Accounts()));
  EXPECT_EQ("-6 LINK_INVALID",
            Result({"check", hash, "--session", session, "--as", "bob", "--password-stdin"},
                   "bobpw\n", Accounts()));
}

}  // namespace
