#include "server/listening_wait.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <syslog.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <stdexcept>
#include <thread>

namespace web {
namespace {

constexpr int kStopped = 0;
constexpr int kConnection = 1;
constexpr std::chrono::milliseconds kBreath{100};

bool Watch(const UniqueFd &events, int fd, uint32_t kind, int meaning) {
  epoll_event event = {};
  event.events = kind;
  event.data.fd = meaning;
  return epoll_ctl(events.get(), EPOLL_CTL_ADD, fd, &event) == 0;
}

}  // namespace

ListeningWait::ListeningWait(int listening_socket)
    : listening_socket_(listening_socket),
      stop_(eventfd(0, EFD_CLOEXEC)),
      events_(epoll_create1(EPOLL_CLOEXEC)) {
  if (!stop_.IsOpen() || !events_.IsOpen() || !Watch(events_, stop_.get(), EPOLLIN, kStopped) ||
      !Watch(events_, listening_socket, EPOLLIN | EPOLLEXCLUSIVE, kConnection))
    throw std::runtime_error("cannot wait for connections");
}

bool ListeningWait::Wait() const {
  epoll_event happened[2] = {};
  int count = 0;
  do {
    count = epoll_wait(events_.get(), happened, 2, -1);
  } while (count < 0 && errno == EINTR);
  for (int i = 0; i < count; ++i)
    if (happened[i].data.fd == kStopped) return false;
  return true;
}

UniqueFd ListeningWait::Accept(int flags, sockaddr *peer, socklen_t *size) const {
  UniqueFd connection(accept4(listening_socket_, peer, size, SOCK_CLOEXEC | flags));
  // Another process was faster, or the visitor has gone; anything else does not end by itself.
  if (connection.IsOpen() || errno == EAGAIN || errno == ECONNABORTED || errno == EINTR)
    return connection;
  syslog(LOG_ERR, "cannot take a connection: %s", strerror(errno));
  std::this_thread::sleep_for(kBreath);
  return connection;
}

void ListeningWait::Stop() {
  eventfd_write(stop_.get(), 1);
}

}  // namespace web
