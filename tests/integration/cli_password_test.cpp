// Where the command line takes passwords from.

#include "integration/cli_support.h"
#include "support/build_folders.h"

namespace {

using testing::HasSubstr;
using testing::Not;
using velk_test::Outcome;
using velk_test::RunOnTerminal;
using velk_test::TempDir;
using velk_test::WriteFile;

class CliPassword : public velk_test::CommandLine {
 protected:
  static bool Opens(const std::string &hash, const std::string &password) {
    return Run({"visit", "login", hash, "--password-stdin"}, password).status == 0;
  }
};

TEST_F(CliPassword, IsTheFirstLineOfStandardInput) {
  const std::string hash = MakeLink({"--password-stdin"}, "  s3cret ä\nmore\n");
  EXPECT_TRUE(Opens(hash, "  s3cret ä"));
  EXPECT_FALSE(Opens(hash, "s3cret ä"));
}

TEST_F(CliPassword, NeedsNoNewlineAtItsEnd) {
  EXPECT_TRUE(Opens(MakeLink({"--password-stdin"}, "secret"), "secret\n"));
}

TEST_F(CliPassword, IsTheFirstLineOfAFile) {
  const TempDir folder;
  WriteFile(folder.File("password"), "secret\nmore\n");
  EXPECT_TRUE(Opens(MakeLink({"--password-file", folder.File("password")}), "secret"));
}

TEST_F(CliPassword, ALineMayEndAsOnWindows) {
  const TempDir folder;
  WriteFile(folder.File("password"), "secret\r\nmore\r\n");
  EXPECT_TRUE(Opens(MakeLink({"--password-file", folder.File("password")}), "secret"));
  EXPECT_TRUE(Opens(MakeLink({"--password-stdin"}, "secret\n"), "secret\r\n"));
  const std::string longest(4096, 'x');
  EXPECT_TRUE(Opens(MakeLink({"--password-stdin"}, longest + "\r\n"), longest));
}

TEST_F(CliPassword, AnyOtherCarriageReturnBelongsToIt) {
  EXPECT_TRUE(Opens(MakeLink({"--password-stdin"}, "sec\rret\n"), "sec\rret"));
  EXPECT_FALSE(Opens(MakeLink({"--password-stdin"}, "secret\r"), "secret"));
  EXPECT_TRUE(Opens(MakeLink({"--password-stdin"}, "secret\r"), "secret\r\r\n"));
  EXPECT_FALSE(Opens(MakeLink({"--password-stdin"}, "secret\r\r\n"), "secret"));
}

TEST_F(CliPassword, AFileThatCannotBeReadIsNamed) {
  const Outcome outcome =
      Run({"link", "create", "--project", "files", "--password-file", "/no/such/file"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("/no/such/file: No such file"));
}

TEST_F(CliPassword, UnfitPasswordsAreRefused) {
  for (const std::string &password :
       {std::string(), std::string("\n"), std::string("\r\n"), std::string("a\0b\n", 4),
        std::string(4097, 'x'), std::string(4096, 'x') + "\r"}) {
    EXPECT_EQ(2,
              Run({"link", "create", "--project", "files", "--password-stdin"}, password).status);
  }
  EXPECT_TRUE(
      Opens(MakeLink({"--password-stdin"}, std::string(4096, 'x')), std::string(4096, 'x')));
}

TEST_F(CliPassword, WithoutATerminalItCannotBeAskedFor) {
  const Outcome outcome =
      velk_test::RunProgram({"setsid", "-w", VELK_BINARY_DIR "/bin/velksharing", "link", "create",
                             "--project", "files", "--password"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("--password-stdin"));
}

TEST_F(CliPassword, IsAskedForTwiceWithoutEcho) {
  const Outcome outcome =
      RunOnTerminal({"link", "create", "--project", "files", "--password"}, {"secret", "secret"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, Not(HasSubstr("secret")));
  const std::string hash = RunJson({"link", "list"})["links"][0]["hash"].asString();
  EXPECT_TRUE(Opens(hash, "secret"));
}

TEST_F(CliPassword, IsNotAskedForWhenTheLinkIsUnknown) {
  const Outcome outcome = RunOnTerminal({"link", "set", "nosuch", "--password"}, {});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("there is no link “nosuch”"));
  EXPECT_THAT(outcome.out, Not(HasSubstr("Password")));
}

TEST_F(CliPassword, IsNotAskedForWhenTheDatabaseIsUnusable) {
  WriteFile(velk_test::SharingDatabasePath(), std::string(8192, 'x'));
  for (const Arguments &command :
       {Arguments{"link", "set", "aB3xK9pQ2"}, Arguments{"link", "create", "--project", "files"}}) {
    Arguments asking = command;
    asking.push_back("--password");
    const Outcome outcome = RunOnTerminal(asking, {});
    EXPECT_EQ(3, outcome.status);
    EXPECT_THAT(outcome.out, Not(HasSubstr("Password")));
  }
}

TEST_F(CliPassword, ChangesALinkWhenAskedFor) {
  const std::string hash = MakeLink();
  EXPECT_EQ(0, RunOnTerminal({"link", "set", hash, "--password"}, {"secret", "secret"}).status);
  EXPECT_TRUE(Opens(hash, "secret"));
}

TEST_F(CliPassword, IsAskedForAgainWhenTheAnswersDiffer) {
  EXPECT_EQ(0, RunOnTerminal({"link", "create", "--project", "files", "--password"},
                             {"secret", "sercet", "other", "other"})
                   .status);
  const std::string hash = RunJson({"link", "list"})["links"][0]["hash"].asString();
  EXPECT_TRUE(Opens(hash, "other"));
}

TEST_F(CliPassword, IsGivenUpAfterThreeDifferentPairs) {
  EXPECT_EQ(2, RunOnTerminal({"link", "create", "--project", "files", "--password"},
                             {"a", "b", "a", "b", "a", "b"})
                   .status);
  EXPECT_EQ(0, RunJson({"link", "list"})["total"].asInt());
}

TEST_F(CliPassword, AnInterruptedQuestionEndsTheProgram) {
  EXPECT_EQ(130,
            RunOnTerminal({"link", "create", "--project", "files", "--password"}, {"\x03"}).status);
}

TEST_F(CliPassword, AVisitAsksForTheOneThatTheLinkNeeds) {
  const std::string hash = MakeLink({"--password-stdin"}, "secret\n");
  const Outcome outcome = RunOnTerminal({"visit", "login", hash}, {"secret"});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("Password of the link: "));
  EXPECT_THAT(outcome.out, HasSubstr("1 OK"));
}

}  // namespace
