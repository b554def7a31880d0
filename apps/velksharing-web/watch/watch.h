#ifndef VELKSHARING_WEB_WATCH_WATCH_H
#define VELKSHARING_WEB_WATCH_WATCH_H

#include <optional>

#include "watch/audit_channel.h"
#include "watch/counters.h"
#include "watch/witness.h"

namespace web::watch {

/// What workers and observer share: made before they are forked. In a worker it is the witness,
/// which hands everything on to the observer.
class Watch : public Witness {
 public:
  /// @param keeps_audit whether there is an audit trail.
  explicit Watch(bool keeps_audit);

  /// A record that the observer has no room for is counted and lost.
  void Keep(const audit::Record &record) override;
  void Count(const Finished &request) override { counters_.Count(request); }

  Counters &counters() { return counters_; }
  /// Null without an audit trail.
  AuditChannel *channel() { return channel_ ? &*channel_ : nullptr; }

 private:
  Counters counters_;
  std::optional<AuditChannel> channel_;
};

}  // namespace web::watch

#endif
