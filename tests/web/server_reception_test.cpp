#include "server/reception.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <fstream>
#include <list>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "server_listener.h"

namespace {

using std::chrono::milliseconds;
using testing::ElementsAre;
using testing::SizeIs;
using web::Reception;
using web::UniqueFd;
using web_test::Listener;

class WebReception : public testing::Test {
 protected:
  ~WebReception() override { StopAll(); }

  /// Starts a thread that takes one connection, and returns once it waits for it, or is done.
  void StartThread(int name) {
    Reception::Clerk &clerk = clerks_.emplace_back();
    std::atomic<pid_t> id = 0;
    threads_.emplace_back([this, &clerk, &id, name] {
      id = gettid();
      const UniqueFd connection = reception_.Accept(clerk);
      const std::lock_guard guard(mutex_);
      (connection.IsOpen() ? served_ : unserved_).push_back(name);
      changed_.notify_all();
    });
    while (id == 0 || Runs(id)) std::this_thread::sleep_for(milliseconds(5));
  }

  static bool Runs(pid_t thread) {
    std::ifstream file("/proc/self/task/" + std::to_string(thread) + "/stat");
    std::string line;
    std::getline(file, line);
    return line.find(") R ") != std::string::npos;
  }

  /// Makes a connection, and returns once a thread has taken it.
  void Connect() {
    ++connections_;
    const UniqueFd client = listener_.Connect();
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [this] { return served_.size() == connections_; });
  }

  void StopAll() {
    reception_.Stop();
    for (std::thread &thread : threads_) thread.join();
    threads_.clear();
  }

  const Listener listener_;
  Reception reception_{listener_.get()};
  std::list<Reception::Clerk> clerks_;
  std::vector<std::thread> threads_;
  size_t connections_ = 0;
  std::mutex mutex_;  // of what follows
  std::condition_variable changed_;
  std::vector<int> served_;    // threads that got a connection, in this order
  std::vector<int> unserved_;  // threads that were sent away
};

TEST_F(WebReception, TheThreadThatCameLastIsTheNext) {
  for (const int name : {0, 1, 2, 3}) StartThread(name);
  for (int count = 0; count < 4; ++count) Connect();
  EXPECT_THAT(served_, ElementsAre(0, 3, 2, 1));
}

TEST_F(WebReception, AThreadThatComesLaterIsServedToo) {
  StartThread(0);
  Connect();
  StartThread(1);
  Connect();
  EXPECT_THAT(served_, ElementsAre(0, 1));
}

TEST_F(WebReception, ConnectionsThatCameBeforeAThreadAreTaken) {
  const UniqueFd early = listener_.Connect();
  ++connections_;
  StartThread(0);
  StartThread(1);
  Connect();
  EXPECT_THAT(served_, ElementsAre(0, 1));
}

TEST_F(WebReception, AllThreadsGoWhenItIsStopped) {
  for (const int name : {0, 1, 2, 3}) StartThread(name);
  StopAll();
  EXPECT_THAT(unserved_, SizeIs(4));
  StartThread(4);
  StopAll();
  EXPECT_THAT(unserved_, SizeIs(5));
}

TEST_F(WebReception, TellsWhetherAnybodyWaits) {
  EXPECT_TRUE(reception_.IsEmpty());
  StartThread(0);
  StartThread(1);
  EXPECT_FALSE(reception_.IsEmpty());
  Connect();
  EXPECT_FALSE(reception_.IsEmpty());
  Connect();
  EXPECT_TRUE(reception_.IsEmpty());
}

TEST(WebReceptionSocket, ThatIsNoneIsRefused) {
  EXPECT_THROW(Reception(-1), std::runtime_error);
}

}  // namespace
