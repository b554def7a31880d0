#include "server/listening_wait.h"

#include <sys/epoll.h>
#include <sys/eventfd.h>

#include <cerrno>
#include <stdexcept>

namespace web {
namespace {

constexpr int kStopped = 0;
constexpr int kConnection = 1;

bool Watch(const UniqueFd &events, int fd, uint32_t kind, int meaning) {
  epoll_event event = {};
  event.events = kind;
  event.data.fd = meaning;
  return epoll_ctl(events.get(), EPOLL_CTL_ADD, fd, &event) == 0;
}

}  // namespace

ListeningWait::ListeningWait(int listening_socket)
    : stop_(eventfd(0, EFD_CLOEXEC)), events_(epoll_create1(EPOLL_CLOEXEC)) {
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

void ListeningWait::Stop() {
  eventfd_write(stop_.get(), 1);
}

}  // namespace web
