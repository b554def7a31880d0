#include "server/acceptor.h"

#include <utility>

namespace web {

Acceptor::Acceptor(int listening_socket, int room, Taker take)
    : take_(std::move(take)), wait_(listening_socket), room_(room) {}

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
  UniqueFd connection = wait_.Accept(SOCK_NONBLOCK, general, &size);
  if (!connection.IsOpen()) return;
  {
    const std::lock_guard guard(mutex_);
    --room_;
  }
  take_(std::move(connection), general, size);
}

}  // namespace web
