#include "site/turn.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <thread>

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;
using std::chrono::steady_clock;
using web::Turn;

/// A pipe by which one process tells another that something has happened.
class Signal {
 public:
  Signal() { EXPECT_EQ(0, pipe(ends_)); }
  Signal(const Signal &) = delete;
  Signal &operator=(const Signal &) = delete;
  ~Signal() {
    close(ends_[0]);
    close(ends_[1]);
  }
  void Give() const { EXPECT_EQ(1, write(ends_[1], "x", 1)); }
  void Await() const {
    char byte = 0;
    EXPECT_EQ(1, read(ends_[0], &byte, 1));
  }

 private:
  int ends_[2] = {};
};

template <typename Work>
pid_t InAnotherProcess(const Work &work) {
  const pid_t pid = fork();
  if (pid != 0) return pid;
  work();
  _exit(testing::Test::HasFailure() ? 1 : 0);
}

int EndOf(pid_t pid) {
  int status = -1;
  waitpid(pid, &status, 0);
  return status;
}

milliseconds TimeToTake() {
  const auto start = steady_clock::now();
  const Turn turn;
  return std::chrono::duration_cast<milliseconds>(steady_clock::now() - start);
}

class SiteTurn : public testing::Test {
 protected:
  static void SetUpTestSuite() { web::ShareTurns(); }
};

TEST_F(SiteTurn, AnotherProcessWaitsUntilItIsGivenBack) {
  const Signal taken;
  const Signal wanted;
  const pid_t holder = InAnotherProcess([&] {
    const Turn turn;
    taken.Give();
    wanted.Await();
    std::this_thread::sleep_for(milliseconds(300));
  });
  taken.Await();
  wanted.Give();
  const milliseconds waited = TimeToTake();
  EXPECT_EQ(0, EndOf(holder));
  EXPECT_GE(waited, milliseconds(250));
  EXPECT_LT(waited, seconds(8));
}

TEST_F(SiteTurn, OneThatIsKilledDuringItsTurnHasLostIt) {
  for (int round = 0; round < 3; ++round) {
    const Signal taken;
    const pid_t holder = InAnotherProcess([&] {
      const Turn turn;
      taken.Give();
      pause();
    });
    taken.Await();
    kill(holder, SIGKILL);
    EXPECT_TRUE(WIFSIGNALED(EndOf(holder)));
    EXPECT_LT(TimeToTake(), seconds(5));
    EXPECT_LT(TimeToTake(), seconds(5));
  }
}

TEST_F(SiteTurn, OneThatWaitsGoesOnWhenTheHolderIsKilled) {
  const Signal taken;
  const pid_t holder = InAnotherProcess([&] {
    const Turn turn;
    taken.Give();
    pause();
  });
  taken.Await();
  const pid_t waiter = InAnotherProcess([&] { EXPECT_LT(TimeToTake(), seconds(8)); });
  std::this_thread::sleep_for(milliseconds(200));
  kill(holder, SIGKILL);
  EndOf(holder);
  EXPECT_EQ(0, EndOf(waiter));
}

}  // namespace
