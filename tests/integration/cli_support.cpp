#include "integration/cli_support.h"

#include <json/reader.h>
#include <poll.h>
#include <pty.h>
#include <sys/wait.h>
#include <unistd.h>

#include <memory>
#include <stdexcept>

#include "support/build_folders.h"
#include "velk_paths.h"

namespace velk_test {
namespace {

constexpr char kProgram[] = VELK_BINARY_DIR "/bin/velksharing";
constexpr int kPatience = 20000;  // milliseconds

void ClearRoot() {
  RemoveSharingDatabase();
  RemoveAutoBlockDatabase();
}

std::vector<std::string> CommandOf(const std::vector<std::string> &arguments) {
  std::vector<std::string> command = {kProgram};
  command.insert(command.end(), arguments.begin(), arguments.end());
  return command;
}

std::string WithoutNewline(const std::string &text) {
  return text.substr(0, text.find('\n'));
}

/// @return false at the end of what the terminal shows, or when it shows nothing for long.
bool ReadMore(int terminal, std::string &shown) {
  pollfd waiting = {terminal, POLLIN, 0};
  if (poll(&waiting, 1, kPatience) != 1) return false;
  char bytes[1024];
  const ssize_t count = read(terminal, bytes, sizeof bytes);
  if (count <= 0) return false;
  shown.append(bytes, static_cast<size_t>(count));
  return true;
}

}  // namespace

void CommandLine::SetUp() {
  if (!OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
  ClearRoot();
}

void CommandLine::TearDown() {
  if (OwnsVelkRoot()) ClearRoot();
}

Outcome CommandLine::Run(const Arguments &arguments, const std::string &input,
                         const std::vector<std::string> &environment) {
  return RunProgram(CommandOf(arguments), input, environment);
}

Json::Value CommandLine::RunJson(Arguments arguments, const std::string &input) {
  arguments.push_back("--json");
  const Outcome outcome = Run(arguments, input);
  EXPECT_EQ(0, outcome.status) << outcome.err;
  Json::Value value;
  std::string errors;
  const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
  EXPECT_TRUE(
      reader->parse(outcome.out.data(), outcome.out.data() + outcome.out.size(), &value, &errors))
      << errors << outcome.out;
  return value;
}

std::string CommandLine::MakeLink(const Arguments &options, const std::string &input) {
  Arguments arguments = {"link", "create", "--project", "files"};
  arguments.insert(arguments.end(), options.begin(), options.end());
  const Outcome outcome = Run(arguments, input);
  EXPECT_EQ(0, outcome.status) << outcome.err;
  return WithoutNewline(outcome.out);
}

std::string CommandLine::LogIn(const std::string &hash, const Arguments &options,
                               const std::string &input) {
  Arguments arguments = {"visit", "login", hash};
  arguments.insert(arguments.end(), options.begin(), options.end());
  return RunJson(arguments, input)["session_id"].asString();
}

std::string CommandLine::StateOf(const std::string &hash) {
  return RunJson({"link", "show", hash})["state"].asString();
}

void CommandLine::Damage(const std::string &hash) {
  RawDatabase(SharingDatabasePath())
      .Run("UPDATE entry SET data = 'no JSON' WHERE hash = '" + hash + "'");
}

Outcome RunOnTerminal(const std::vector<std::string> &arguments,
                      const std::vector<std::string> &answers) {
  const std::vector<std::string> command = CommandOf(arguments);
  int terminal = -1;
  const pid_t child = forkpty(&terminal, nullptr, nullptr, nullptr);
  if (child == -1) throw std::runtime_error("forkpty failed");
  if (child == 0) {
    std::vector<char *> argv;
    for (const std::string &argument : command)
      argv.push_back(const_cast<char *>(argument.c_str()));
    argv.push_back(nullptr);
    execv(argv[0], argv.data());
    _exit(127);
  }
  Outcome outcome;
  for (const std::string &answer : answers) {
    std::string question;
    while (!question.ends_with(": ") && ReadMore(terminal, question)) {
    }
    outcome.out += question;
    const std::string line = answer + "\n";
    EXPECT_EQ(static_cast<ssize_t>(line.size()), write(terminal, line.data(), line.size()));
  }
  while (ReadMore(terminal, outcome.out)) {
  }
  int status = 0;
  close(terminal);  // Hangs up on a program that still waits for an answer.
  waitpid(child, &status, 0);
  outcome.status = WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
  return outcome;
}

}  // namespace velk_test
