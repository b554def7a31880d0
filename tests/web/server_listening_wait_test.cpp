#include "server/listening_wait.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <thread>
#include <vector>

#include "server_listener.h"

namespace {

using std::chrono::milliseconds;
using web::ListeningWait;
using web::UniqueFd;
using web_test::Listener;

TEST(WebListeningWait, EndsWhenAConnectionIsThere) {
  const Listener listener;
  const ListeningWait wait(listener.get());
  const UniqueFd client = listener.Connect();
  EXPECT_TRUE(wait.Wait());
  EXPECT_TRUE(wait.Wait());  // nobody has accepted it yet
  EXPECT_TRUE(listener.Accept().IsOpen());
}

TEST(WebListeningWait, EndsForGoodWhenItIsStopped) {
  const Listener listener;
  ListeningWait wait(listener.get());
  std::thread stopper([&wait] {
    std::this_thread::sleep_for(milliseconds(50));
    wait.Stop();
  });
  EXPECT_FALSE(wait.Wait());
  stopper.join();
  const UniqueFd client = listener.Connect();
  EXPECT_FALSE(wait.Wait());
}

TEST(WebListeningWait, AConnectionDoesNotWakeAllWhoWait) {
  constexpr int kWaiters = 6;
  const Listener listener;
  std::vector<std::unique_ptr<ListeningWait>> waits;
  std::vector<std::thread> threads;
  std::atomic<int> woken = 0;
  for (int i = 0; i < kWaiters; ++i)
    waits.push_back(std::make_unique<ListeningWait>(listener.get()));
  for (const auto &wait : waits)
    threads.emplace_back([&wait, &woken] { woken += wait->Wait() ? 1 : 0; });
  std::this_thread::sleep_for(milliseconds(100));
  const UniqueFd client = listener.Connect();
  std::this_thread::sleep_for(milliseconds(100));
  const int awake = woken;
  for (const auto &wait : waits) wait->Stop();
  for (std::thread &thread : threads) thread.join();
  EXPECT_GE(awake, 1);
  EXPECT_LT(awake, kWaiters);
}

TEST(WebListeningWait, WhatIsNoSocketIsRefused) {
  EXPECT_THROW(ListeningWait(-1), std::runtime_error);
}

}  // namespace
