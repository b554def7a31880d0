#include "server/notebook.h"

#include <syslog.h>

#include <chrono>

#include "audit/database.h"
#include "audit/trail.h"
#include "audit/writer.h"

namespace web {
namespace {

using std::chrono::microseconds;

constexpr int kPatience = 10'000;  // milliseconds

}  // namespace

void Notebook::Store(const Settings &settings) const {
  if (records_.empty()) return;
  const auto oldest = std::chrono::system_clock::now() - AuditRetention(settings);
  try {
    audit::Writer writer(audit::kTrailPath, kPatience);
    writer.Append(records_);
    writer.RemoveBefore(
        std::chrono::duration_cast<microseconds>(oldest.time_since_epoch()).count());
  } catch (const audit::DatabaseError &error) {
    syslog(LOG_ERR, "audit trail %s: %s", audit::kTrailPath, error.what());
  }
}

}  // namespace web
