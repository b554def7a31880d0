#ifndef VELKSHARING_WEB_WATCH_AUDIT_CHANNEL_H
#define VELKSHARING_WEB_WATCH_AUDIT_CHANNEL_H

#include <optional>

#include "audit/record.h"
#include "http/unique_fd.h"

namespace web::watch {

/// The way of audit records from the workers to the observer. Made before they are forked; what is
/// in it survives the death of either. Each process closes the end that it does not use, and the
/// process that forks them keeps both, for those that come later.
class AuditChannel {
 public:
  /// @throws std::runtime_error.
  AuditChannel();

  /// Hands a record over without waiting. Any thread may.
  /// @return false when there is no room.
  bool Send(const audit::Record &record) const;
  /// Takes a record out without waiting; for one thread at a time.
  std::optional<audit::Record> Receive();
  /// Whether all senders are gone and everything is taken out, as far as Receive() has seen.
  bool IsAtEnd() const { return is_at_end_; }

  /// To be polled for what Receive() takes.
  int receiver() const { return receiver_.get(); }

  void CloseSender() { sender_.Reset(); }
  void CloseReceiver() { receiver_.Reset(); }

 private:
  UniqueFd sender_;
  UniqueFd receiver_;
  bool is_at_end_ = false;
};

}  // namespace web::watch

#endif
