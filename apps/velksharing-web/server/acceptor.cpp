#include "server/acceptor.h"

#include <syslog.h>

#include <cerrno>
#include <chrono>
#include <cstring>

namespace web {
namespace {

constexpr std::chrono::milliseconds kBreath{100};

}  // namespace

Acceptor::Acceptor(int listening_socket, int room, Taker take)
    : listening_socket_(listening_socket),
      take_(std::move(take)),
      wait_(listening_socket),
      room_(room) {}

Acceptor::~Acceptor() {
  Stop();
}

void Acceptor::Start() {
  thread_ = std::thread([this] { Run(); });
}

void Acceptor::Release() {
  const std::lock_guard guard(mutex_);
  ++room_;
  changed_.notify_all();
}

void Acceptor::Stop() {
  {
    const std::lock_guard guard(mutex_);
    is_stopping_ = true;
  }
  changed_.notify_all();
  wait_.Stop();
  if (thread_.joinable()) thread_.join();
}

void Acceptor::Run() {
  while (WaitForRoom() && wait_.Wait()) AcceptOne();
}

bool Acceptor::WaitForRoom() {
  std::unique_lock lock(mutex_);
  changed_.wait(lock, [this] { return is_stopping_ || room_ > 0; });
  return !is_stopping_;
}

void Acceptor::AcceptOne() {
  sockaddr_storage peer = {};
  socklen_t size = sizeof(peer);
  auto *general = reinterpret_cast<sockaddr *>(&peer);
  UniqueFd connection(accept4(listening_socket_, general, &size, SOCK_CLOEXEC | SOCK_NONBLOCK));
  if (connection.IsOpen()) {
    {
      const std::lock_guard guard(mutex_);
      --room_;
    }
    take_(std::move(connection), general, size);
    return;
  }
  // Another process was faster, or the visitor has gone; anything else does not end by itself.
  if (errno == EAGAIN || errno == ECONNABORTED || errno == EINTR) return;
  syslog(LOG_ERR, "cannot take a connection: %s", strerror(errno));
  std::this_thread::sleep_for(kBreath);
}

}  // namespace web
