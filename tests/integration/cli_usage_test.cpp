// How the command line answers what makes no sense, and what it prints for people and machines.

#include <unistd.h>

#include "integration/cli_support.h"
#include "support/build_folders.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;
using velk_test::Outcome;
using velk_test::RunProgram;

class CliUsage : public velk_test::CommandLine {};

const std::vector<std::vector<std::string>> kCommands = {
    {"link", "create"},
    {"link", "list"},
    {"link", "show"},
    {"link", "set"},
    {"link", "enable"},
    {"link", "disable"},
    {"link", "delete"},
    {"link", "purge"},
    {"link", "url"},
    {"link", "why"},
    {"link", "log"},
    {"session", "list"},
    {"session", "delete"},
    {"session", "purge"},
    {"token", "list"},
    {"token", "delete"},
    {"token", "purge"},
    {"block", "list"},
    {"block", "add"},
    {"block", "remove"},
    {"visit", "login"},
    {"visit", "check"},
    {"visit", "logout"},
    {"db", "status"},
    {"db", "check"},
    {"db", "vacuum"},
    {"db", "backup"},
    {"link"},
    {"session"},
    {"token"},
    {"block"},
    {"visit"},
    {"db"},
    {},
};

TEST_F(CliUsage, HelpEverywhereShowsAnExample) {
  for (std::vector<std::string> command : kCommands) {
    const std::string name = testing::PrintToString(command);
    command.push_back("--help");
    const Outcome outcome = Run(command);
    EXPECT_EQ(0, outcome.status) << name;
    EXPECT_THAT(outcome.out, HasSubstr("Example:\n  velksharing ")) << name;
    EXPECT_THAT(outcome.err, IsEmpty()) << name;
  }
}

TEST_F(CliUsage, TellsItsVersion) {
  EXPECT_THAT(Run({"--version"}).out, StartsWith("velksharing 6."));
}

TEST_F(CliUsage, NoCommandIsAnError) {
  const Outcome outcome = Run({});
  EXPECT_EQ(2, outcome.status);
  EXPECT_THAT(outcome.err, StartsWith("velksharing: "));
}

TEST_F(CliUsage, AnUnknownOptionIsNamedWithoutItsValue) {
  const Outcome outcome = Run({"link", "list", "--pasword=tops3cret"});
  EXPECT_EQ(2, outcome.status);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr("--pasword"), Not(HasSubstr("tops3cret"))));
}

TEST_F(CliUsage, AMistypedOptionIsNamedThoughAnotherIsMissing) {
  EXPECT_THAT(Run({"link", "create", "--projct", "files"}).err,
              StartsWith("velksharing: unknown option: --projct; see velksharing link create"));
}

TEST_F(CliUsage, AMistypedCommandIsToldFromAMissingOne) {
  EXPECT_EQ("velksharing: there is no such command; see velksharing --help\n", Run({"lnik"}).err);
  EXPECT_EQ("velksharing: there is no such command; see velksharing link --help\n",
            Run({"link", "lits"}).err);
  EXPECT_EQ("velksharing: a command is needed; see velksharing link --help\n", Run({"link"}).err);
}

TEST_F(CliUsage, AnUnfitValueIsToldInPlainWords) {
  const auto message = [](const Arguments &command) {
    const std::string err = Run(command).err;
    return err.substr(0, err.find("; see "));
  };
  EXPECT_EQ("velksharing: ID: Value abc not in range 1 to 2147483647",
            message({"session", "delete", "abc"}));
  EXPECT_EQ("velksharing: ID: Value 99999999999 not in range 1 to 2147483647",
            message({"token", "delete", "1", "99999999999"}));
  EXPECT_EQ("velksharing: --session needs a value", message({"token", "list", "--session="}));
  EXPECT_EQ("velksharing: --project needs a value", message({"link", "create", "--project"}));
  EXPECT_EQ("velksharing: --project is given more than once",
            message({"link", "create", "--project", "a", "--project", "b"}));
  EXPECT_EQ("velksharing: --json takes no value", message({"link", "list", "--json=maybe"}));
}

TEST_F(CliUsage, APasswordThatWasGivenAsAnArgumentIsNotRepeated) {
  for (const auto &arguments :
       {Arguments{"--password", "tops3cret"}, Arguments{"--password=tops3cret"},
        Arguments{"--password-stdin=tops3cret"}}) {
    Arguments command = {"link", "create", "--project", "files"};
    command.insert(command.end(), arguments.begin(), arguments.end());
    const Outcome outcome = Run(command);
    EXPECT_EQ(2, outcome.status);
    EXPECT_THAT(outcome.out + outcome.err, Not(HasSubstr("tops3cret")));
  }
}

TEST_F(CliUsage, AFailedCommandLineMakesNoDatabase) {
  EXPECT_EQ(2, Run({"link", "create"}).status);
  EXPECT_EQ(2, Run({"link", "create", "--project", "files", "--uses", "none"}).status);
  EXPECT_NE(0, access(velk_test::SharingDatabasePath().c_str(), F_OK));
}

TEST_F(CliUsage, ControlCharactersDoNotReachTheTerminal) {
  MakeLink({"--title", "a\x1b[31mb\x7f\u202Ec\xff"});
  const Outcome outcome = Run({"link", "list"});
  EXPECT_THAT(outcome.out, HasSubstr("a\uFFFD[31mb\uFFFD\uFFFDc\uFFFD"));
  EXPECT_THAT(outcome.out, Not(HasSubstr("\x1b")));
}

TEST_F(CliUsage, ControlCharactersOfAnArgumentDoNotReachTheTerminalEither) {
  const Outcome outcome = Run({"link", "show", "\x1b]0;evil\x07"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr("]0;evil"), Not(HasSubstr("\x1b"))));
}

TEST_F(CliUsage, ColumnsAreAlignedByWhatATerminalShows) {
  MakeLink({"--title", "end", "--owner", "0"});
  velk_test::RawDatabase(velk_test::SharingDatabasePath())
      .Run("UPDATE entry SET project_name = '日本é'");
  const std::string out = Run({"link", "list"}).out;
  const std::string row = out.substr(out.find('\n') + 1);
  // Five columns of text under the seven of "PROJECT": two blanks more than between columns.
  EXPECT_THAT(row, HasSubstr("  日本é    root"));
}

TEST_F(CliUsage, JsonKeepsEveryByteThatIsText) {
  const std::string hash = MakeLink({"--title", "Größe \"7\"\n\t日本"});
  EXPECT_EQ("Größe \"7\"\n\t日本", RunJson({"link", "show", hash})["protect_title"].asString());
}

TEST_F(CliUsage, AFullOutputIsAnErrorOfTheSystem) {
  MakeLink();
  const Outcome outcome = RunProgram(
      {"/bin/sh", "-c", "exec " VELK_BINARY_DIR "/bin/velksharing link list >/dev/full"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("could not be written"));
}

TEST_F(CliUsage, AnUnusableDatabaseIsNamedWithTheLikelyReason) {
  velk_test::WriteFile(velk_test::SharingDatabasePath(), std::string(8192, 'x'));
  const Outcome outcome = Run({"link", "list"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr(velk_test::SharingDatabasePath()),
                                 HasSubstr("it is not an SQLite database")));
}

TEST_F(CliUsage, ASymbolicLinkIsNoDatabase) {
  const velk_test::TempDir folder;
  velk_test::WriteFile(folder.File("elsewhere"), "");
  ASSERT_EQ(0, symlink(folder.File("elsewhere").c_str(), velk_test::SharingDatabasePath().c_str()));
  const Outcome outcome = Run({"link", "list"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("symbolic link"));
}

TEST_F(CliUsage, AnotherUserIsToldWhoMayUseIt) {
  if (geteuid() != 0) GTEST_SKIP() << "needs root to become somebody else";
  MakeLink();
  const Outcome outcome = RunProgram({"setpriv", "--reuid=65534", "--regid=65534", "--clear-groups",
                                      VELK_BINARY_DIR "/bin/velksharing", "link", "list"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("only root and the system account"));
}

}  // namespace
