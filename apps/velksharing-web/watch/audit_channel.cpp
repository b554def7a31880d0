#include "watch/audit_channel.h"

#include <netinet/in.h>
#include <sys/socket.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <type_traits>

namespace web::watch {
namespace {

constexpr size_t kLongestAddress = INET6_ADDRSTRLEN + 4;  // with "/128"
constexpr int kRoom = 1024 * 1024;                        // bytes; the kernel may give less

/// A record between processes of one program.
struct Message {
  int64_t time;
  int32_t entry_id;
  int32_t event;
  int32_t result;
  uint32_t uid;
  bool has_uid;
  char address[kLongestAddress];
};
static_assert(std::is_trivially_copyable_v<Message>);

Message MessageOf(const audit::Record &record) {
  Message message = {};
  message.time = record.time;
  message.entry_id = record.entry_id;
  message.event = static_cast<int32_t>(record.event);
  message.result = record.result;
  message.uid = record.uid.value_or(0);
  message.has_uid = record.uid.has_value();
  record.address.copy(message.address, kLongestAddress - 1);
  return message;
}

audit::Record RecordOf(const Message &message) {
  audit::Record record;
  record.time = message.time;
  record.entry_id = message.entry_id;
  record.event = static_cast<audit::Event>(message.event);
  record.result = message.result;
  if (message.has_uid) record.uid = message.uid;
  record.address = message.address;
  return record;
}

}  // namespace

AuditChannel::AuditChannel() {
  int ends[2] = {};
  if (socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0)
    throw std::runtime_error("no socket for the audit trail");
  sender_.Reset(ends[0]);
  receiver_.Reset(ends[1]);
  setsockopt(sender_.get(), SOL_SOCKET, SO_SNDBUF, &kRoom, sizeof(kRoom));
}

bool AuditChannel::Send(const audit::Record &record) const {
  const Message message = MessageOf(record);
  constexpr int kFlags = MSG_DONTWAIT | MSG_NOSIGNAL;
  ssize_t sent = 0;
  do {
    sent = send(sender_.get(), &message, sizeof(message), kFlags);
  } while (sent < 0 && errno == EINTR);
  return sent == static_cast<ssize_t>(sizeof(message));
}

std::optional<audit::Record> AuditChannel::Receive() {
  Message message = {};
  ssize_t received = 0;
  do {
    received = recv(receiver_.get(), &message, sizeof(message), MSG_DONTWAIT);
  } while (received < 0 && errno == EINTR);
  is_at_end_ = received == 0;
  if (received != static_cast<ssize_t>(sizeof(message))) return std::nullopt;
  return RecordOf(message);
}

}  // namespace web::watch
