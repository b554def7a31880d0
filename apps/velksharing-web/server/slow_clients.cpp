#include "server/slow_clients.h"

#include <sys/socket.h>

namespace web {
namespace {

constexpr std::chrono::milliseconds kLook{250};

}  // namespace

SlowClients::SlowClients(std::chrono::milliseconds patience)
    : patience_(patience), watch_([this] { Watch(); }) {}

SlowClients::~SlowClients() {
  {
    const std::lock_guard guard(mutex_);
    is_over_ = true;
  }
  is_over_changed_.notify_all();
  watch_.join();
}

void SlowClients::Expect(int socket) {
  const std::lock_guard guard(mutex_);
  deadlines_[socket] = Clock::now() + patience_;
}

void SlowClients::Forget(int socket) {
  const std::lock_guard guard(mutex_);
  deadlines_.erase(socket);
}

void SlowClients::Watch() {
  std::unique_lock lock(mutex_);
  while (!is_over_changed_.wait_for(lock, kLook, [this] { return is_over_; })) {
    CutLate(Clock::now());
  }
}

void SlowClients::CutLate(Clock::time_point now) {
  for (auto one = deadlines_.begin(); one != deadlines_.end();) {
    if (one->second > now) {
      ++one;
      continue;
    }
    // Its own thread sees the end of the connection and closes the socket, after Forget().
    shutdown(one->first, SHUT_RDWR);
    one = deadlines_.erase(one);
  }
}

}  // namespace web
