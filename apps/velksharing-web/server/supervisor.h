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

/// Runs worker processes and replaces those that end before they are told to: at once when one has
/// lived for a while, else after a pause that doubles from 0.1 to 10 seconds. SIGHUP is passed on.
/// SIGTERM and SIGINT stop the workers; those that are not done some seconds after `stop_timeout`,
/// or at a second signal, are killed.
///
/// To be called while the process has one thread.
/// @param work what a worker does; its result is the worker's exit status.
/// @param stopping called in the supervisor when it begins to stop.
/// @return the supervisor's exit status.
int Supervise(int workers, std::chrono::seconds stop_timeout,
              const std::function<int(WorkerSignals &)> &work,
              const std::function<void()> &stopping);

/// Blocks the signals that supervisor and workers wait for, and ignores SIGPIPE. For the first
/// thread, before there are others.
void PrepareSignals();

}  // namespace web

#endif
