#ifndef VELKSHARING_WEB_SERVER_SUPERVISOR_H
#define VELKSHARING_WEB_SERVER_SUPERVISOR_H

#include <chrono>
#include <functional>

#include "http/unique_fd.h"

namespace web {

/// What a worker process is told from outside.
class WorkerSignals {
 public:
  enum class Kind {
    STOP,    ///< SIGTERM, or the supervisor is gone: finish what runs, and end.
    RELOAD,  ///< SIGHUP: reopen logs, read templates anew.
  };

  /// Listens for the signals, which must be blocked.
  /// @param lifeline end of a pipe that closes with the supervisor; null for none.
  explicit WorkerSignals(UniqueFd lifeline);

  /// Waits for the next one.
  Kind Wait();

 private:
  UniqueFd signals_;
  UniqueFd lifeline_;
};

/// What a child process is for.
enum class Task {
  WORK,    ///< Serves visitors.
  OBSERVE  ///< Tells about it.
};

/// What a supervisor does.
struct Supervision {
  int workers = 1;
  bool has_observer = false;
  std::chrono::seconds stop_timeout{30};
  /// What a child does; its result is the child's exit status.
  std::function<int(Task, WorkerSignals &)> work;
  /// Called in the supervisor when a child has ended unasked.
  std::function<void(Task)> lost;
  /// Called in the supervisor when it begins to stop.
  std::function<void()> stopping;
};

/// Runs worker processes, and an observer where one is wanted, and replaces those that end before
/// they are told to: at once when one has lived for a while, else after a pause that doubles from
/// 0.1 to 10 seconds. SIGHUP is passed on. SIGTERM and SIGINT stop them; those that are not done
/// some seconds after `stop_timeout`, or at a second signal, are killed.
///
/// To be called while the process has one thread.
/// @return the supervisor's exit status.
int Supervise(const Supervision &supervision);

/// Blocks the signals that supervisor and workers wait for, and ignores SIGPIPE. For the first
/// thread, before there are others.
void PrepareSignals();

}  // namespace web

#endif
