#include "server/connection_watch.h"

#include <sys/socket.h>
#include <sys/stat.h>

namespace web {
namespace {

constexpr std::chrono::milliseconds kLook{250};

}  // namespace

ConnectionWatch::ConnectionWatch(std::chrono::milliseconds patience)
    : patience_(patience), watch_([this] { Watch(); }) {}

ConnectionWatch::~ConnectionWatch() {
  {
    const std::lock_guard guard(mutex_);
    is_over_ = true;
  }
  is_over_changed_.notify_all();
  watch_.join();
}

void ConnectionWatch::Expect(int socket) {
  Limit limit;
  limit.deadline = Clock::now() + patience_;
  Set(socket, std::move(limit));
}

void ConnectionWatch::WatchFile(int socket, UniqueFd file, off_t end) {
  Limit limit;
  limit.file = std::move(file);
  limit.end = end;
  Set(socket, std::move(limit));
}

void ConnectionWatch::Forget(int socket) {
  const std::lock_guard guard(mutex_);
  limits_.erase(socket);
}

void ConnectionWatch::Set(int socket, Limit limit) {
  const std::lock_guard guard(mutex_);
  limits_.insert_or_assign(socket, std::move(limit));
}

void ConnectionWatch::Watch() {
  std::unique_lock lock(mutex_);
  while (!is_over_changed_.wait_for(lock, kLook, [this] { return is_over_; })) CutHopeless();
}

void ConnectionWatch::CutHopeless() {
  for (auto one = limits_.begin(); one != limits_.end();) {
    if (!IsHopeless(one->second)) {
      ++one;
      continue;
    }
    // Its own thread sees the end of the connection and closes the socket, after Forget().
    shutdown(one->first, SHUT_RDWR);
    one = limits_.erase(one);
  }
}

bool ConnectionWatch::IsHopeless(const Limit &limit) {
  if (limit.deadline) return *limit.deadline <= Clock::now();
  struct stat file = {};
  return fstat(limit.file.get(), &file) != 0 || file.st_size < limit.end;
}

}  // namespace web
