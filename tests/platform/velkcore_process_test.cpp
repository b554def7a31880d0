#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <iterator>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "support/process.h"
#include "support/temp_dir.h"
#include "velk/velkcore.h"

namespace {

using velk_test::ReadFile;
using velk_test::RunForked;
using velk_test::TempDir;
using velk_test::WriteFile;

FILE *Start(const std::vector<std::string> &arguments, const char *mode) {
  std::vector<const char *> argv;
  for (const std::string &argument : arguments) argv.push_back(argument.c_str());
  argv.push_back(nullptr);
  return VLIBCPopenv(argv[0], mode, argv.data());
}

std::string ReadAll(FILE *file) {
  std::string text;
  std::array<char, 4096> chunk;
  size_t count;
  while ((count = fread(chunk.data(), 1, chunk.size(), file)) > 0) text.append(chunk.data(), count);
  return text;
}

/// What a program prints; "(not started)" when it cannot be started, "(failed)" after another exit
/// status than 0.
std::string OutputOf(const std::vector<std::string> &arguments) {
  FILE *const file = Start(arguments, "r");
  if (file == nullptr) return "(not started)";
  const std::string text = ReadAll(file);
  return VLIBCPclose(file) == 0 ? text : "(failed)";
}

int CloseStatusOf(const std::vector<std::string> &arguments) {
  FILE *const file = Start(arguments, "r");
  return file == nullptr ? -1 : VLIBCPclose(file);
}

size_t OpenDescriptors() {
  const std::filesystem::directory_iterator descriptors("/proc/self/fd");
  return static_cast<size_t>(std::distance(begin(descriptors), end(descriptors)));
}

bool HasNoChild() {
  return waitpid(-1, nullptr, WNOHANG) == -1 && errno == ECHILD;
}

/// A signal set in /proc/PID/status, as a number.
unsigned long long SignalsOf(const std::string &status, const std::string &name) {
  const size_t line = status.find(name + ":");
  return line == std::string::npos
             ? ~0ULL
             : std::stoull(status.substr(line + name.size() + 1), nullptr, 16);
}

constexpr unsigned long long BitOf(int signal_number) {
  return 1ULL << (signal_number - 1);
}

TEST(VelkPopen, ReadsWhatTheProgramPrints) {
  EXPECT_EQ(OutputOf({"/bin/echo", "hello"}), "hello\n");
}

TEST(VelkPopen, PassesArgumentsAsTheyAre) {
  EXPECT_EQ(OutputOf({"/usr/bin/printf", "[%s]", "a b", "", "\"q\" 'q'", "$HOME *", ";exit 1", "\\",
                      "new\nline", "\xff\xfe"}),
            "[a b][][\"q\" 'q'][$HOME *][;exit 1][\\][new\nline][\xff\xfe]");
}

TEST(VelkPopen, GivesTheProgramTheNameInItsFirstArgument) {
  const char *const argv[] = {"another name", "-c", "echo \"$0\"", nullptr};
  FILE *const file = VLIBCPopenv("/bin/sh", "r", argv);
  ASSERT_NE(file, nullptr);
  EXPECT_EQ(ReadAll(file), "another name\n");
  EXPECT_EQ(VLIBCPclose(file), 0);
}

TEST(VelkPopen, PassesALongArgument) {
  const std::string argument(100000, 'x');
  EXPECT_EQ(OutputOf({"/usr/bin/printf", "%s", argument}), argument);
}

TEST(VelkPopen, PassesTheEnvironmentOfTheCaller) {
  ASSERT_EQ(setenv("VELK_TEST_VARIABLE", "a value", 1), 0);
  EXPECT_EQ(OutputOf({"/usr/bin/printenv", "VELK_TEST_VARIABLE"}), "a value\n");
  unsetenv("VELK_TEST_VARIABLE");
}

TEST(VelkPopen, ReadsMoreThanAPipeHolds) {
  EXPECT_EQ(OutputOf({"/usr/bin/head", "-c", "1000000", "/dev/zero"}), std::string(1000000, '\0'));
}

TEST(VelkPopen, GivesAReadProgramNoInput) {
  EXPECT_EQ(OutputOf({"/bin/cat"}), "");
}

TEST(VelkPopen, WritesToTheProgram) {
  const TempDir folder;
  FILE *const file = Start({"/bin/sh", "-c", "cat >\"$0\"", folder.File("out")}, "w");
  ASSERT_NE(file, nullptr);
  EXPECT_GT(fputs("text for the program", file), 0);
  EXPECT_EQ(VLIBCPclose(file), 0);
  EXPECT_EQ(ReadFile(folder.File("out")), "text for the program");
}

TEST(VelkPopen, LeavesTheOutputOfAWrittenProgramToTheCaller) {
  const TempDir folder;
  const int result = RunForked([&] {
    const int out = open(folder.File("out").c_str(), O_WRONLY | O_CREAT, 0600);
    if (dup2(out, STDOUT_FILENO) == -1) return 1;
    FILE *const file = Start({"/bin/cat"}, "w");
    if (file == nullptr) return 2;
    fputs("passed on", file);
    return VLIBCPclose(file);
  });
  EXPECT_EQ(result, 0);
  EXPECT_EQ(ReadFile(folder.File("out")), "passed on");
}

TEST(VelkPopen, LeavesStandardErrorToTheCallerEvenWhenItIsCloseOnExec) {
  const TempDir folder;
  const int result = RunForked([&] {
    const int err = open(folder.File("err").c_str(), O_WRONLY | O_CREAT, 0600);
    if (dup3(err, STDERR_FILENO, O_CLOEXEC) == -1) return 1;
    return CloseStatusOf({"/bin/sh", "-c", "echo trouble >&2"});
  });
  EXPECT_EQ(result, 0);
  EXPECT_EQ(ReadFile(folder.File("err")), "trouble\n");
}

TEST(VelkPopen, PassesNoOtherDescriptor) {
  const int result = RunForked([] {
    for (int i = 0; i < 50; ++i) {
      if (dup(STDERR_FILENO) == -1) return 1;
    }
    if (dup2(STDERR_FILENO, 500) == -1) return 2;
    // 3 is the folder that the program itself is listing.
    return OutputOf({"/bin/ls", "/proc/self/fd"}) == "0\n1\n2\n3\n" ? 0 : 3;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPopen, PassesNoStreamOfAnEarlierProgram) {
  FILE *const first = Start({"/bin/cat"}, "w");
  ASSERT_NE(first, nullptr);
  FILE *const second = Start({"/bin/cat"}, "w");
  ASSERT_NE(second, nullptr);
  EXPECT_EQ(VLIBCPclose(first), 0);  // would wait for ever if the second held its pipe
  EXPECT_EQ(VLIBCPclose(second), 0);
}

TEST(VelkPopen, MakesACloseOnExecStream) {
  for (const char *const mode : {"r", "w"}) {
    FILE *const file = Start({"/bin/true"}, mode);
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(fcntl(fileno(file), F_GETFD), FD_CLOEXEC);
    VLIBCPclose(file);
  }
}

TEST(VelkPopen, ReadsWithAnyOfTheStandardDescriptorsClosed) {
  for (int closed = 1; closed < 8; ++closed) {
    const int result = RunForked([closed] {
      for (int standard = 0; standard < 3; ++standard) {
        if ((closed & 1 << standard) != 0) close(standard);
      }
      // All three are there for the program: the folder it lists is number 3 again.
      return OutputOf({"/bin/ls", "/proc/self/fd"}) == "0\n1\n2\n3\n" ? 0 : 1;
    });
    EXPECT_EQ(result, 0) << "closed: " << closed;
  }
}

TEST(VelkPopen, WritesWithAnyOfTheStandardDescriptorsClosed) {
  for (int closed = 1; closed < 8; ++closed) {
    const TempDir folder;
    const int result = RunForked([&] {
      for (int standard = 0; standard < 3; ++standard) {
        if ((closed & 1 << standard) != 0) close(standard);
      }
      FILE *const file = Start({"/usr/bin/tee", folder.File("out")}, "w");
      if (file == nullptr) return 1;
      fputs("passed on", file);
      return VLIBCPclose(file) == 0 ? 0 : 2;
    });
    EXPECT_EQ(result, 0) << "closed: " << closed;
    EXPECT_EQ(ReadFile(folder.File("out")), "passed on") << "closed: " << closed;
  }
}

TEST(VelkPopen, KeepsItsStreamOffTheStandardDescriptors) {
  const int result = RunForked([] {
    close(0);
    close(1);
    FILE *const file = Start({"/bin/true"}, "r");
    const bool off =
        file != nullptr && fileno(file) > 2 && fcntl(0, F_GETFD) == -1 && fcntl(1, F_GETFD) == -1;
    return off ? VLIBCPclose(file) : 1;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPopen, RestoresIgnoredSignalsThatWouldBreakTheProgram) {
  const int result = RunForked([] {
    signal(SIGPIPE, SIG_IGN);
    FILE *const file = Start({"/bin/cat", "/proc/self/status"}, "r");
    if (file == nullptr) return 1;
    const unsigned long long ignored = SignalsOf(ReadAll(file), "SigIgn");
    VLIBCPclose(file);
    return (ignored & (BitOf(SIGPIPE) | BitOf(SIGCHLD))) == 0 ? 0 : 2;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPopen, BlocksNoSignalInTheProgram) {
  const int result = RunForked([] {
    sigset_t signals;
    sigfillset(&signals);
    sigprocmask(SIG_BLOCK, &signals, nullptr);
    return SignalsOf(OutputOf({"/bin/cat", "/proc/self/status"}), "SigBlk") == 0 ? 0 : 1;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPopen, LeavesTheSignalsOfTheCallerAsTheyWere) {
  const std::string before = ReadFile("/proc/thread-self/status");
  ASSERT_EQ(OutputOf({"/bin/true"}), "");
  const std::string after = ReadFile("/proc/thread-self/status");
  EXPECT_EQ(SignalsOf(after, "SigBlk"), SignalsOf(before, "SigBlk"));
  EXPECT_EQ(SignalsOf(after, "SigIgn"), SignalsOf(before, "SigIgn"));
}

TEST(VelkPopen, SaysThatAProgramIsMissing) {
  const TempDir folder;
  EXPECT_EQ(Start({folder.File("missing")}, "r"), nullptr);
  EXPECT_EQ(errno, ENOENT);
  EXPECT_EQ(Start({""}, "r"), nullptr);
  EXPECT_EQ(errno, ENOENT);
}

TEST(VelkPopen, DoesNotSearchForTheProgram) {
  EXPECT_EQ(Start({"true"}, "r"), nullptr);
  EXPECT_EQ(errno, ENOENT);
}

TEST(VelkPopen, SaysThatAProgramMayNotBeExecuted) {
  const TempDir folder;
  WriteFile(folder.File("program"), "#!/bin/sh\n");
  ASSERT_EQ(chmod(folder.File("program").c_str(), 0644), 0);
  EXPECT_EQ(Start({folder.File("program")}, "w"), nullptr);
  EXPECT_EQ(errno, EACCES);
  EXPECT_EQ(Start({folder.path()}, "w"), nullptr);
  EXPECT_EQ(errno, EACCES);
}

TEST(VelkPopen, HandsNoUnknownFormatToAShell) {
  const TempDir folder;
  WriteFile(folder.File("program"), "echo run by a shell\n");
  ASSERT_EQ(chmod(folder.File("program").c_str(), 0755), 0);
  EXPECT_EQ(Start({folder.File("program")}, "r"), nullptr);
  EXPECT_EQ(errno, ENOEXEC);
}

TEST(VelkPopen, SaysThatTheArgumentsAreTooLong) {
  const std::vector<std::string> arguments(200, std::string(100000, 'x'));
  std::vector<std::string> command = {"/bin/true"};
  command.insert(command.end(), arguments.begin(), arguments.end());
  EXPECT_EQ(Start(command, "r"), nullptr);
  EXPECT_EQ(errno, E2BIG);
}

TEST(VelkPopen, RefusesNullAndAnEmptyArgumentList) {
  const char *const argv[] = {"/bin/true", nullptr};
  const char *const empty[] = {nullptr};
  errno = 0;
  EXPECT_EQ(VLIBCPopenv(nullptr, "r", argv), nullptr);
  EXPECT_EQ(std::exchange(errno, 0), EINVAL);
  EXPECT_EQ(VLIBCPopenv("/bin/true", nullptr, argv), nullptr);
  EXPECT_EQ(std::exchange(errno, 0), EINVAL);
  EXPECT_EQ(VLIBCPopenv("/bin/true", "r", nullptr), nullptr);
  EXPECT_EQ(std::exchange(errno, 0), EINVAL);
  EXPECT_EQ(VLIBCPopenv("/bin/true", "r", empty), nullptr);
  EXPECT_EQ(std::exchange(errno, 0), EINVAL);
}

TEST(VelkPopen, RefusesAnyOtherMode) {
  for (const char *const mode : {"", "a", "rw", "r+", "re", "R"}) {
    errno = 0;
    EXPECT_EQ(Start({"/bin/true"}, mode), nullptr) << mode;
    EXPECT_EQ(errno, EINVAL) << mode;
  }
}

TEST(VelkPopen, LeavesNothingBehindWhenItFails) {
  const size_t before = OpenDescriptors();
  EXPECT_EQ(Start({"/nowhere/program"}, "r"), nullptr);
  EXPECT_EQ(Start({"/nowhere/program"}, "w"), nullptr);
  EXPECT_EQ(OpenDescriptors(), before);
  EXPECT_TRUE(HasNoChild());
}

TEST(VelkPopen, FailsCleanlyWhenDescriptorsRunOut) {
  for (unsigned int spare = 0; spare < 4; ++spare) {
    const int result = RunForked([spare] {
      const int first_free = dup(STDERR_FILENO);
      close(first_free);
      const rlimit limit = {static_cast<rlim_t>(first_free) + spare,
                            static_cast<rlim_t>(first_free) + spare};
      if (setrlimit(RLIMIT_NOFILE, &limit) == -1) return 1;
      errno = 0;
      FILE *const file = Start({"/bin/true"}, "r");
      if (file == nullptr && errno != EMFILE) return 2;
      if (file != nullptr && VLIBCPclose(file) != 0) return 3;
      if (file == nullptr && spare >= 2) return 4;
      const int now_free = dup(STDERR_FILENO);
      return (now_free == first_free || spare == 0) && HasNoChild() ? 0 : 5;
    });
    EXPECT_EQ(result, 0) << "spare descriptors: " << spare;
  }
}

TEST(VelkPopen, LeaksNothingInAThousandRounds) {
  const size_t before = OpenDescriptors();
  for (int i = 0; i < 1000; ++i) {
    ASSERT_EQ(CloseStatusOf({"/bin/true"}), 0);
  }
  EXPECT_EQ(OpenDescriptors(), before);
  EXPECT_TRUE(HasNoChild());
}

TEST(VelkPopen, ServesManyThreadsAtOnce) {
  std::vector<std::thread> threads;
  std::array<int, 8> right{};
  for (size_t i = 0; i < right.size(); ++i) {
    threads.emplace_back([i, &right] {
      for (int round = 0; round < 25; ++round) {
        const std::string text = std::to_string(i) + "-" + std::to_string(round);
        if (OutputOf({"/usr/bin/printf", "%s", text}) == text) ++right[i];
      }
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_THAT(right, testing::Each(25));
}

TEST(VelkPclose, GivesTheExitStatus) {
  const int status = CloseStatusOf({"/bin/sh", "-c", "exit 42"});
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), 42);
}

TEST(VelkPclose, GivesTheSignalThatEndedTheProgram) {
  const int status = CloseStatusOf({"/bin/sh", "-c", "kill -KILL $$"});
  ASSERT_TRUE(WIFSIGNALED(status));
  EXPECT_EQ(WTERMSIG(status), SIGKILL);
}

TEST(VelkPclose, EndsAProgramWhoseOutputIsNotReadToItsEnd) {
  const int status = CloseStatusOf({"/usr/bin/yes"});
  ASSERT_TRUE(WIFSIGNALED(status));
  EXPECT_EQ(WTERMSIG(status), SIGPIPE);
}

TEST(VelkPclose, LeavesOtherChildrenToTheirOwner) {
  const pid_t other = fork();
  if (other == 0) _exit(7);
  ASSERT_EQ(CloseStatusOf({"/bin/sleep", "0.1"}), 0);
  int status = 0;
  ASSERT_EQ(waitpid(other, &status, 0), other);
  EXPECT_EQ(WEXITSTATUS(status), 7);
}

TEST(VelkPclose, ClosesStreamsInAnyOrder) {
  FILE *const first = Start({"/bin/sh", "-c", "exit 1"}, "r");
  FILE *const second = Start({"/bin/sh", "-c", "exit 2"}, "r");
  ASSERT_NE(first, nullptr);
  ASSERT_NE(second, nullptr);
  EXPECT_EQ(WEXITSTATUS(VLIBCPclose(second)), 2);
  EXPECT_EQ(WEXITSTATUS(VLIBCPclose(first)), 1);
}

TEST(VelkPclose, WaitsOnWhenSignalsArrive) {
  const int result = RunForked([] {
    static volatile sig_atomic_t signals = 0;
    struct sigaction action = {};
    action.sa_handler = [](int) { signals = signals + 1; };  // without SA_RESTART
    sigaction(SIGALRM, &action, nullptr);
    FILE *const file = Start({"/bin/sh", "-c", "sleep 0.3; exit 9"}, "r");
    if (file == nullptr) return 1;
    const itimerval every_20_ms = {{0, 20000}, {0, 20000}};
    setitimer(ITIMER_REAL, &every_20_ms, nullptr);
    const int status = VLIBCPclose(file);
    if (signals == 0) return 2;
    return WIFEXITED(status) && WEXITSTATUS(status) == 9 ? 0 : 3;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPclose, SaysThatTheStatusIsLostWhenTheCallerIgnoresItsChildren) {
  const int result = RunForked([] {
    signal(SIGCHLD, SIG_IGN);
    FILE *const file = Start({"/bin/echo", "hello"}, "r");
    if (file == nullptr) return 1;
    if (ReadAll(file) != "hello\n") return 2;
    errno = 0;
    return VLIBCPclose(file) == -1 && errno == ECHILD ? 0 : 3;
  });
  EXPECT_EQ(result, 0);
}

TEST(VelkPclose, RefusesNull) {
  errno = 0;
  EXPECT_EQ(VLIBCPclose(nullptr), -1);
  EXPECT_EQ(errno, EINVAL);
}

TEST(VelkPclose, RefusesAStreamOfAnotherMakerAndLeavesItOpen) {
  FILE *const file = fopen("/dev/null", "r");
  ASSERT_NE(file, nullptr);
  errno = 0;
  EXPECT_EQ(VLIBCPclose(file), -1);
  EXPECT_EQ(errno, EINVAL);
  EXPECT_EQ(fclose(file), 0);
}

}  // namespace
