#ifndef OPERATIONS_AUDIT_LOG_H
#define OPERATIONS_AUDIT_LOG_H

#include <json/value.h>

#include <functional>
#include <memory>
#include <optional>

#include "audit/reader.h"
#include "audit/record.h"
#include "operations/failure.h"

/// What velksharing-web has kept of a link's visitors.

namespace operations {

/// Which visits of a link.
struct AuditQuery {
  int entry_id = 0;           ///< The link's row id; it may be deleted.
  std::optional<long> since;  ///< Not before this second since the Unix epoch.
  std::optional<int> limit;   ///< The last ones, so many.
};

/// Reads the visits of one link, piece by piece while they come.
///
///     AuditLog log(query);
///     log.Read(print);      // what there is
///     log.Read(print);      // later: what has come since
class AuditLog {
 public:
  explicit AuditLog(const AuditQuery &query);

  /// Hands over what has been stored since the last call, the oldest first.
  /// @return false when there is no audit trail (yet).
  /// @throws Failure DATABASE when it cannot be read.
  bool Read(const std::function<void(const audit::Record &)> &take);

 private:
  bool Open();

  audit::Query query_;
  std::unique_ptr<audit::Reader> reader_;
};

/// What to throw when there is no audit trail and one is needed.
Failure NoAuditTrail();

/// "login", "enter", "logout"
const char *EventName(audit::Event event);
/// "OK", "WRONG_PASSWORD"
const char *ResultName(const audit::Record &record);

Json::Value ToJson(const audit::Record &record);

}  // namespace operations

#endif
