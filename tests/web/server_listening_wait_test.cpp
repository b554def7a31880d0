#include "server/listening_wait.h"

#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <thread>
#include <vector>

namespace {

using std::chrono::milliseconds;
using web::ListeningWait;
using web::UniqueFd;

/// A socket that listens on a port of this machine.
class Listener {
 public:
  Listener() : socket_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0)) {
    address_.sin_family = AF_INET;
    address_.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    EXPECT_EQ(0, bind(socket_.get(), reinterpret_cast<sockaddr *>(&address_), sizeof address_));
    EXPECT_EQ(0, listen(socket_.get(), 8));
    socklen_t size = sizeof address_;
    getsockname(socket_.get(), reinterpret_cast<sockaddr *>(&address_), &size);
  }

  UniqueFd Connect() const {
    UniqueFd client(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
    EXPECT_EQ(
        0, connect(client.get(), reinterpret_cast<const sockaddr *>(&address_), sizeof address_));
    return client;
  }
  UniqueFd Accept() const { return UniqueFd(accept(socket_.get(), nullptr, nullptr)); }
  int get() const { return socket_.get(); }

 private:
  UniqueFd socket_;
  sockaddr_in address_ = {};
};

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
