#include "login_saslauthd.h"

#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <string>

#include "secret.h"
#include "velk_paths.h"

namespace velk {
namespace {

constexpr char kPath[] = VELK_SASLAUTHD_SOCKET;
constexpr std::string_view kService = "velk";
constexpr std::string_view kRealm = "";
constexpr time_t kTimeoutSeconds = 10;
constexpr size_t kLengthBytes = 2;

void LogFailure(const char *reason) {
  syslog(LOG_ERR, "saslauthd at %s: %s", kPath, reason);
}

void LogErrno() {
  const bool timed_out = errno == EAGAIN || errno == EWOULDBLOCK;
  LogFailure(timed_out ? "no answer in time" : strerror(errno));
}

/// A stream to saslauthd, closed at the end of the scope.
class Stream {
 public:
  Stream() = default;
  Stream(const Stream &) = delete;
  Stream &operator=(const Stream &) = delete;
  ~Stream() {
    if (socket_ != -1) close(socket_);
  }

  /// To be called once. On failure, errno tells why.
  bool Connect() {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (sizeof(kPath) > sizeof(address.sun_path)) {
      errno = ENAMETOOLONG;
      return false;
    }
    memcpy(address.sun_path, kPath, sizeof(kPath));
    socket_ = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (socket_ == -1 || !LimitWaits()) return false;
    int outcome;
    do {
      outcome = connect(socket_, reinterpret_cast<sockaddr *>(&address), sizeof(address));
    } while (outcome == -1 && errno == EINTR);
    return outcome == 0;
  }

  bool Write(std::string_view bytes) {
    while (!bytes.empty()) {
      const ssize_t count = send(socket_, bytes.data(), bytes.size(), MSG_NOSIGNAL);
      if (count == -1 && errno == EINTR) continue;
      if (count == -1) return false;
      bytes.remove_prefix(static_cast<size_t>(count));
    }
    return true;
  }

  bool Read(char *out, size_t length) {
    while (length > 0) {
      const ssize_t count = recv(socket_, out, length, 0);
      if (count == -1 && errno == EINTR) continue;
      if (count == 0) errno = ECONNRESET;
      if (count <= 0) return false;
      out += count;
      length -= static_cast<size_t>(count);
    }
    return true;
  }

 private:
  bool LimitWaits() {
    const timeval limit{kTimeoutSeconds, 0};
    return setsockopt(socket_, SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof(limit)) == 0 &&
           setsockopt(socket_, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof(limit)) == 0;
  }

  int socket_ = -1;
};

/// Appends one field: its length in two bytes, the high one first, then its bytes.
char *PutField(char *out, std::string_view field) {
  *out++ = static_cast<char>(field.size() >> 8);
  *out++ = static_cast<char>(field.size() & 0xff);
  memcpy(out, field.data(), field.size());
  return out + field.size();
}

Secret MakeRequest(std::string_view name, std::string_view password) {
  Secret request(4 * kLengthBytes + name.size() + password.size() + kService.size() +
                 kRealm.size());
  char *out = request.data();
  for (const std::string_view field : {name, password, kService, kRealm}) {
    out = PutField(out, field);
  }
  return request;
}

/// Reads the answer: a text in the form of a request's field.
bool ReadReply(Stream &stream, std::string &reply) {
  unsigned char length[kLengthBytes];
  if (!stream.Read(reinterpret_cast<char *>(length), sizeof(length))) return false;
  reply.resize(static_cast<size_t>(length[0]) << 8 | length[1]);
  return stream.Read(reply.data(), reply.size());
}

/// What it means that there is no connection. A saslauthd that is too busy to take us, and our own
/// lack of means, must not decide who is asked about an account: they refuse.
SaslauthdAnswer AnswerWithoutConnection() {
  switch (errno) {
    case ENOENT:
    case ECONNREFUSED:
      return SaslauthdAnswer::kNotReachable;
    case EAGAIN:
    case EMFILE:
    case ENFILE:
    case ENOBUFS:
    case ENOMEM:
      LogErrno();
      return SaslauthdAnswer::kRefused;
    default:
      LogErrno();
      return SaslauthdAnswer::kNotReachable;
  }
}

}  // namespace

SaslauthdAnswer AskSaslauthd(std::string_view name, std::string_view password) {
  Stream stream;
  if (!stream.Connect()) return AnswerWithoutConnection();
  std::string reply;
  if (!stream.Write(MakeRequest(name, password).view()) || !ReadReply(stream, reply)) {
    LogErrno();
    return SaslauthdAnswer::kRefused;
  }
  if (reply.starts_with("OK")) return SaslauthdAnswer::kAccepted;
  if (!reply.starts_with("NO")) LogFailure("an answer that is neither yes nor no");
  return SaslauthdAnswer::kRefused;
}

}  // namespace velk
