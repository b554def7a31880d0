#include "server/sockets.h"

#include <fcntl.h>
#include <grp.h>
#include <netdb.h>
#include <netinet/in.h>
#include <sys/stat.h>
#include <sys/un.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <system_error>

#include "common/address.h"
#include "common/config_file.h"
#include "velk_paths.h"

namespace web {
namespace {

constexpr int kBacklog = 1024;
constexpr int kFirstActivated = 3;

[[noreturn]] void Fail(const std::string &what) {
  throw std::runtime_error(what + ": " + std::generic_category().message(errno));
}

void MakeReady(int fd) {
  if (fcntl(fd, F_SETFL, fcntl(fd, F_GETFL) | O_NONBLOCK) != 0 ||
      fcntl(fd, F_SETFD, FD_CLOEXEC) != 0)
    Fail("cannot prepare the socket");
}

struct HostAndPort {
  std::string host;
  std::string port;
};

HostAndPort Split(const std::string &address) {
  const size_t colon = address.rfind(':');
  if (colon == std::string::npos || colon == 0)
    throw std::runtime_error("not ADDRESS:PORT, [ADDRESS]:PORT or a path");
  std::string host = address.substr(0, colon);
  if (host.size() > 2 && host.front() == '[' && host.back() == ']') {
    host = host.substr(1, host.size() - 2);
  } else if (host.find(':') != std::string::npos) {
    throw std::runtime_error("an IPv6 address needs brackets: [ADDRESS]:PORT");
  }
  const std::string port = address.substr(colon + 1);
  velk::ConfigNumber(port, 0, 65535);
  return {host, port};
}

UniqueFd ListenOnPort(const std::string &address) {
  const auto [host, port] = Split(address);
  addrinfo hints = {};
  hints.ai_socktype = SOCK_STREAM;
  hints.ai_flags = AI_PASSIVE;
  addrinfo *found = nullptr;
  if (const int error = getaddrinfo(host.c_str(), port.c_str(), &hints, &found); error != 0)
    throw std::runtime_error(gai_strerror(error));
  const std::unique_ptr<addrinfo, decltype(&freeaddrinfo)> addresses(found, &freeaddrinfo);

  UniqueFd fd(socket(found->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0));
  if (!fd.IsOpen()) Fail("socket");
  const int yes = 1;
  setsockopt(fd.get(), SOL_SOCKET, SO_REUSEADDR, &yes, sizeof(yes));
  if (bind(fd.get(), found->ai_addr, found->ai_addrlen) != 0) Fail("cannot be taken");
  return fd;
}

sockaddr_un PathAddress(const std::string &path) {
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof(address.sun_path)) throw std::runtime_error("path too long");
  memcpy(address.sun_path, path.data(), path.size());
  return address;
}

/// Removes a socket that nobody listens on any more; leaves everything else.
void RemoveAbandoned(const std::string &path, const sockaddr_un &address) {
  struct stat found = {};
  if (lstat(path.c_str(), &found) != 0 || !S_ISSOCK(found.st_mode)) return;
  const UniqueFd probe(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
  const auto *general = reinterpret_cast<const sockaddr *>(&address);
  if (connect(probe.get(), general, sizeof(address)) != 0 && errno == ECONNREFUSED)
    unlink(path.c_str());
}

gid_t GroupId(const std::string &name) {
  if (name.empty()) return static_cast<gid_t>(-1);
  const group *found = getgrnam(name.c_str());
  if (found == nullptr) throw std::runtime_error("no group " + name);
  return found->gr_gid;
}

UniqueFd ListenOnPath(const std::string &path, const SocketAccess &access) {
  const sockaddr_un address = PathAddress(path);
  RemoveAbandoned(path, address);
  UniqueFd fd(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  if (!fd.IsOpen()) Fail("socket");
  // Nobody connects before the group is right.
  const mode_t old_mask = umask(0177);
  const int bound = bind(fd.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address));
  umask(old_mask);
  if (bound != 0) Fail("cannot be taken");
  const gid_t group = GroupId(access.group);
  if (lchown(path.c_str(), VELK_SYSTEM_UID, group) != 0 &&
      lchown(path.c_str(), static_cast<uid_t>(-1), group) != 0)
    Fail("cannot be given to group " + access.group);
  if (chmod(path.c_str(), access.mode) != 0) Fail("cannot get its mode");
  return fd;
}

UniqueFd ActivatedSocket() {
  const char *pid = getenv("LISTEN_PID");
  const char *count = getenv("LISTEN_FDS");
  if (pid == nullptr || count == nullptr || std::to_string(getpid()) != pid) return UniqueFd();
  const bool is_one = strcmp(count, "1") == 0;
  unsetenv("LISTEN_PID");
  unsetenv("LISTEN_FDS");
  if (!is_one)
    throw std::runtime_error("exactly one socket can be served, not " + std::string(count));
  if (!IsListening(kFirstActivated))
    throw std::runtime_error("descriptor 3 is no socket that takes connections");
  return UniqueFd(kFirstActivated);
}

}  // namespace

bool IsListening(int fd) {
  int listens = 0;
  socklen_t size = sizeof(listens);
  return getsockopt(fd, SOL_SOCKET, SO_ACCEPTCONN, &listens, &size) == 0 && listens != 0;
}

UniqueFd Listen(const std::string &address, const SocketAccess &access) {
  try {
    UniqueFd fd = address.front() == '/' ? ListenOnPath(address, access) : ListenOnPort(address);
    if (listen(fd.get(), kBacklog) != 0) Fail("cannot listen");
    MakeReady(fd.get());
    return fd;
  } catch (const std::runtime_error &error) {
    throw std::runtime_error(address + ": " + error.what());
  }
}

UniqueFd InheritedSocket() {
  UniqueFd fd = ActivatedSocket();
  if (!fd.IsOpen() && IsListening(STDIN_FILENO))
    fd.Reset(fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, kFirstActivated));
  if (fd.IsOpen()) MakeReady(fd.get());
  return fd;
}

std::string AddressOf(int listening_socket) {
  sockaddr_storage address = {};
  socklen_t size = sizeof(address);
  auto *general = reinterpret_cast<sockaddr *>(&address);
  if (getsockname(listening_socket, general, &size) != 0) return "?";
  if (address.ss_family == AF_UNIX)
    return reinterpret_cast<const sockaddr_un *>(&address)->sun_path;
  char host[NI_MAXHOST] = "";
  char port[NI_MAXSERV] = "";
  getnameinfo(general, size, host, sizeof(host), port, sizeof(port),
              NI_NUMERICHOST | NI_NUMERICSERV);
  const bool needs_brackets = address.ss_family == AF_INET6;
  return needs_brackets ? std::string("[") + host + "]:" + port : std::string(host) + ":" + port;
}

std::string PeerAddress(const sockaddr *address) {
  velk::Address peer;
  peer.family = address->sa_family;
  if (peer.family == AF_INET) {
    peer.v4 = reinterpret_cast<const sockaddr_in *>(address)->sin_addr;
  } else if (peer.family == AF_INET6) {
    peer.v6 = reinterpret_cast<const sockaddr_in6 *>(address)->sin6_addr;
  } else {
    return "";
  }
  // Through its text, which makes an IPv4 visitor of an IPv6 socket one of IPv4.
  const auto parsed = velk::ParseAddress(velk::PrintAddress(peer).c_str());
  return parsed ? velk::PrintAddress(*parsed) : "";
}

}  // namespace web
