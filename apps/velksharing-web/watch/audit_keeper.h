#ifndef VELKSHARING_WEB_WATCH_AUDIT_KEEPER_H
#define VELKSHARING_WEB_WATCH_AUDIT_KEEPER_H

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "audit/writer.h"
#include "http/unique_fd.h"
#include "watch/audit_channel.h"
#include "watch/counters.h"

namespace web::watch {

/// Stores what comes through the channel, on a thread of its own, and removes what is too old, at
/// the beginning and every hour. Waits while others hold the file; what a file that does not work
/// cannot take is counted and lost, which the log tells once a minute at most.
class AuditKeeper {
 public:
  /// @param channel of which this process has closed the sender; must outlive this.
  /// @param retention how long records are kept.
  AuditKeeper(AuditChannel &channel, const std::string &path, std::chrono::hours retention,
              CounterTable &counters);
  AuditKeeper(const AuditKeeper &) = delete;
  AuditKeeper &operator=(const AuditKeeper &) = delete;
  /// Ends at once; what was not stored is lost.
  ~AuditKeeper();

  /// Waits until all senders are gone and everything is stored, or the time is up.
  void Finish(std::chrono::seconds patience);

 private:
  using Clock = std::chrono::steady_clock;

  void Run();
  void WaitForMore() const;
  void TakeIn();
  void Store();
  void RemoveOldWhenDue();
  void Complain(const char *reason);
  void Lose();
  bool IsStopped() const;

  AuditChannel &channel_;
  const std::string path_;
  const std::chrono::hours retention_;
  CounterTable &counters_;
  audit::Writer writer_;
  std::vector<audit::Record> waiting_;  ///< Taken in and not stored.
  Clock::time_point next_removal_;
  Clock::time_point next_complaint_;

  UniqueFd stop_;  ///< Readable when the thread has to end.
  std::mutex end_mutex_;
  std::condition_variable has_ended_;
  bool is_over_ = false;
  std::thread thread_;
};

}  // namespace web::watch

#endif
