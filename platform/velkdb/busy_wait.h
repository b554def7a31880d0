#ifndef VELKDB_BUSY_WAIT_H
#define VELKDB_BUSY_WAIT_H

#include <chrono>

struct sqlite3;

namespace velkdb {

/// How one connection waits for other processes: in short sleeps, up to 10 seconds for a statement
/// as a whole, however many locks it waits for.
///
/// The sleeps grow and vary at random, so that many waiters neither crowd nor fall into step.
class BusyWait {
 public:
  BusyWait() = default;
  BusyWait(const BusyWait &) = delete;
  BusyWait &operator=(const BusyWait &) = delete;

  /// Makes SQLite wait through this object, which must outlive the connection.
  void Attach(sqlite3 *connection);

  /// A statement starts; its 10 seconds run from here.
  void StartStatement();

  /// Sleeps once. `attempt` counts from 0 for each lock that is waited for.
  /// @return false, without a sleep, when the time is over.
  bool Sleep(int attempt);

  /// The statement has ended. Locks taken past it (a backup through the connection beneath) are
  /// waited for up to 10 seconds each.
  void EndStatement();

 private:
  using Clock = std::chrono::steady_clock;

  Clock::time_point deadline_;
  bool in_statement_ = false;
};

}  // namespace velkdb

#endif
