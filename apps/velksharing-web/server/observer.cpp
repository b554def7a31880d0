#include "server/observer.h"

#include <sys/prctl.h>

#include <optional>

#include "audit/trail.h"
#include "watch/audit_keeper.h"
#include "watch/gauges.h"
#include "watch/metrics_server.h"
#include "watch/metrics_text.h"

namespace web {
namespace {

constexpr int kDone = 0;
constexpr std::chrono::seconds kBeyondTimeout{1};

}  // namespace

int Observe(const Settings &settings, UniqueFd metrics_socket, watch::Watch &watch,
            WorkerSignals &signals) {
  prctl(PR_SET_NAME, "velk-observer");
  watch::CounterTable &counters = watch.counters().table();
  std::optional<watch::AuditKeeper> keeper;
  if (watch.channel() != nullptr) {
    watch.channel()->CloseSender();
    keeper.emplace(*watch.channel(), audit::kTrailPath, AuditRetention(settings), counters);
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

}  // namespace web
