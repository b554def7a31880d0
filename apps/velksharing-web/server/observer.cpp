#include "server/observer.h"

#include <sys/prctl.h>
#include <syslog.h>

#include <optional>

#include "audit/database.h"
#include "audit/trail.h"
#include "audit/writer.h"
#include "watch/audit_keeper.h"
#include "watch/gauges.h"
#include "watch/metrics_server.h"
#include "watch/metrics_text.h"

namespace web {
namespace {

constexpr int kDone = 0;
constexpr int kFilePatience = 10'000;  // milliseconds
constexpr std::chrono::seconds kBeyondTimeout{1};

std::chrono::hours Retention(const Settings &settings) {
  return std::chrono::hours(24) * settings.audit_retention;
}

}  // namespace

int Observe(const Settings &settings, UniqueFd metrics_socket, watch::Watch &watch,
            WorkerSignals &signals) {
  prctl(PR_SET_NAME, "velk-observer");
  watch::CounterTable &counters = watch.counters().table();
  std::optional<watch::AuditKeeper> keeper;
  if (watch.channel() != nullptr) {
    watch.channel()->CloseSender();
    keeper.emplace(*watch.channel(), audit::kTrailPath, Retention(settings), counters);
  }
  watch::GaugeReader gauges;
  std::optional<watch::MetricsServer> server;
  if (metrics_socket.IsOpen()) {
    server.emplace(std::move(metrics_socket),
                   [&] { return watch::MetricsText(counters, gauges.Read()); });
  }
  while (signals.Wait() == WorkerSignals::Kind::RELOAD) {
  }
  if (keeper) keeper->Finish(std::chrono::seconds(settings.stop_timeout) + kBeyondTimeout);
  return kDone;
}

void StoreAuditRecords(const Settings &settings, const std::vector<audit::Record> &records) {
  if (records.empty()) return;
  const auto oldest = std::chrono::system_clock::now() - Retention(settings);
  const auto since =
      std::chrono::duration_cast<std::chrono::microseconds>(oldest.time_since_epoch());
  try {
    audit::Writer writer(audit::kTrailPath, kFilePatience);
    writer.Append(records);
    writer.RemoveBefore(since.count());
  } catch (const audit::DatabaseError &error) {
    syslog(LOG_ERR, "audit trail %s: %s", audit::kTrailPath, error.what());
  }
}

}  // namespace web
