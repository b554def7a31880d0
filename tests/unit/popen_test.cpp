#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <velksharing/utils.h>

#include <cerrno>
#include <filesystem>
#include <iterator>
#include <string>
#include <thread>
#include <vector>

#include "support/log_capture.h"
#include "support/process.h"
#include "support/scripted_program.h"

/// Programs that behave badly, under both services that run one.

namespace {

using namespace VELK::sharing;
using ::testing::SizeIs;
using velk_test::LogCapture;
using velk_test::RunForked;
using velk_test::ScriptedProgram;

/// The URL; "(failed)" when there is none.
std::string Url() {
  std::string url;
  _tag_SHARING_URL_TYPE type;
  return GetSharingURL("hash", 0, true, "", url, type) ? url : "(failed)";
}

/// The answer, a text; "(failed)" when there is none.
std::string WebapiText() {
  Json::Value out;
  return SendWebapi(out, "api", 1, "method", Json::Value()) ? out.asString() : "(failed)";
}

size_t OpenDescriptors() {
  const std::filesystem::directory_iterator descriptors("/proc/self/fd");
  return static_cast<size_t>(std::distance(begin(descriptors), end(descriptors)));
}

bool HasNoChild() {
  return waitpid(-1, nullptr, WNOHANG) == -1 && errno == ECHILD;
}

/// What a caller finds that takes SIGPIPE as the system does: how many of the two calls failed, or
/// 128 and the number of the signal that ended it.
int FailuresWithoutProtectionFromSigpipe() {
  return RunForked([] {
    signal(SIGPIPE, SIG_DFL);
    return (Url() == "(failed)" ? 1 : 0) + (WebapiText() == "(failed)" ? 1 : 0);
  });
}

/// Sends this process SIGALRM every 5 ms, to a handler that lets no system call go on.
void StartInterruptions() {
  struct sigaction action = {};
  action.sa_handler = [](int) {};
  sigaction(SIGALRM, &action, nullptr);
  const itimerval every_5_ms = {{0, 5000}, {0, 5000}};
  setitimer(ITIMER_REAL, &every_5_ms, nullptr);
}

/// Gives a program's background process its life, and waits for its end.
class Background {
 public:
  explicit Background(const ScriptedProgram &program) : program_(program) {
    velk_test::WriteFile(program_.File("wanted"), "");
  }
  Background(const Background &) = delete;
  Background &operator=(const Background &) = delete;
  ~Background() { End(); }

  bool HasEnded() const { return std::filesystem::exists(program_.File("ended")); }
  void End() {
    std::filesystem::remove(program_.File("wanted"));
    while (!HasEnded()) std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }

 private:
  const ScriptedProgram &program_;
};

/// Commands that start it. `first` are its own first ones.
std::string BackgroundProcess(const std::string &first) {
  return "(" + first +
         "while [ -e \"$FOLDER/wanted\" ]; do sleep 0.01; done; : >\"$FOLDER/ended\") & ";
}

TEST(Popen, FailsWhenTheProgramClosesItsOutputWithoutAWord) {
  const LogCapture log;
  const ScriptedProgram program("exec >&-");
  EXPECT_EQ(FailuresWithoutProtectionFromSigpipe(), 2);
}

TEST(Popen, WaitsForAProgramThatClosesItsOutputEarly) {
  const ScriptedProgram program("printf '\"abc\"\\n1\\n'; exec >&-; sleep 0.1; >\"$FOLDER/ended\"");
  EXPECT_EQ(Url(), "\"abc\"");
  EXPECT_TRUE(std::filesystem::remove(program.File("ended")));
  EXPECT_EQ(WebapiText(), "abc");
  EXPECT_TRUE(std::filesystem::remove(program.File("ended")));
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, TakesWhatAKilledProgramHadPrinted) {
  const ScriptedProgram program("printf '\"abc\"\\n1\\n'; kill -KILL $$");
  EXPECT_EQ(Url(), "\"abc\"");
  EXPECT_EQ(WebapiText(), "abc");
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, FailsWhenTheProgramIsKilledBeforeItsAnswerIsComplete) {
  const LogCapture log;
  const ScriptedProgram program("printf '\"abc\\n'; kill -KILL $$");
  EXPECT_EQ(FailuresWithoutProtectionFromSigpipe(), 2);
}

TEST(Popen, FailsWhenTheProgramMayNotBeExecuted) {
  const LogCapture log;
  const ScriptedProgram program("printf '\"abc\"\\n1\\n'");
  ASSERT_EQ(chmod(program.path().c_str(), 0644), 0);
  EXPECT_EQ(Url(), "(failed)");
  EXPECT_EQ(WebapiText(), "(failed)");
  EXPECT_THAT(log.lines(), SizeIs(4));
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, FailsWhenTheProgramIsOfAnUnknownFormat) {
  const LogCapture log;
  const ScriptedProgram program("");
  velk_test::WriteFile(program.path(), "printf '\"abc\"\\n1\\n'\n");
  EXPECT_EQ(Url(), "(failed)");
  EXPECT_EQ(WebapiText(), "(failed)");
  EXPECT_THAT(log.lines(), SizeIs(4));
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, GivesTheProgramNoInputToWaitFor) {
  const ScriptedProgram program("cat; printf '\"abc\"\\n1\\n'");
  EXPECT_EQ(Url(), "\"abc\"");
  EXPECT_EQ(WebapiText(), "abc");
}

TEST(Popen, EndsAProgramThatPrintsOnBehindTheUrl) {
  const ScriptedProgram program("exec yes 1");
  EXPECT_EQ(Url(), "1");
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, GivesTheUrlWhileABackgroundProcessHoldsTheOutput) {
  const ScriptedProgram program(BackgroundProcess("") + "printf 'abc\\n1\\n'");
  const Background background(program);
  EXPECT_EQ(Url(), "abc");
  EXPECT_FALSE(background.HasEnded());
}

TEST(Popen, ReadsTheAnswerThatABackgroundProcessCompletes) {
  const ScriptedProgram program("(sleep 0.1; printf 'def\"') & printf '\"abc'");
  EXPECT_EQ(WebapiText(), "abcdef");
}

TEST(Popen, DoesNotWaitForABackgroundProcessThatHasLetGoOfTheOutput) {
  const ScriptedProgram program(BackgroundProcess("exec >&-; ") + "echo '\"abc\"'");
  const Background background(program);
  EXPECT_EQ(WebapiText(), "abc");
  EXPECT_FALSE(background.HasEnded());
}

TEST(Popen, ReadsOnWhenSignalsArrive) {
  const ScriptedProgram program(
      "printf '\"a'; sleep 0.1; printf 'b'; sleep 0.1; printf 'c\"\\n'; sleep 0.1; echo 1");
  const int result = RunForked([] {
    StartInterruptions();
    return Url() == "\"abc\"" ? 0 : 1;
  });
  EXPECT_EQ(result, 0);
}

TEST(Popen, ReadsToTheEndWhenSignalsArrive) {
  const ScriptedProgram program("printf '\"a'; sleep 0.1; printf 'b'; sleep 0.1; printf 'c\"'");
  const int result = RunForked([] {
    StartInterruptions();
    return WebapiText() == "abc" ? 0 : 1;
  });
  EXPECT_EQ(result, 0);
}

TEST(Popen, WorksForACallerWhoIgnoresHisChildren) {
  const ScriptedProgram program("printf '\"abc\"\\n1\\n'");
  const int result = RunForked([] {
    signal(SIGCHLD, SIG_IGN);
    return Url() == "\"abc\"" && WebapiText() == "abc" ? 0 : 1;
  });
  EXPECT_EQ(result, 0);
}

TEST(Popen, LeavesNoDescriptorAndNoChildWhenItFails) {
  const LogCapture log;
  const size_t descriptors = OpenDescriptors();
  for (const char *const script : {"", "echo abc", "echo {", "kill -KILL $$"}) {
    const ScriptedProgram program(script);
    EXPECT_EQ(Url(), "(failed)") << script;
    EXPECT_EQ(WebapiText(), "(failed)") << script;
  }
  EXPECT_EQ(OpenDescriptors(), descriptors);
  EXPECT_TRUE(HasNoChild());
}

TEST(Popen, LeavesNoDescriptorAndNoChildInTenThousandCalls) {
  const ScriptedProgram program("printf '\"abc\"\\n1\\n'");
  ASSERT_EQ(Url(), "\"abc\"");
  const size_t descriptors = OpenDescriptors();
  for (int i = 0; i < 5000; ++i) {
    ASSERT_EQ(Url(), "\"abc\"");
    ASSERT_EQ(WebapiText(), "abc");
  }
  EXPECT_EQ(OpenDescriptors(), descriptors);
  EXPECT_TRUE(HasNoChild());
}

}  // namespace
