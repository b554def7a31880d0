#ifndef BENCH_WORKER_H
#define BENCH_WORKER_H

#include <functional>
#include <memory>

#include "cases.h"

namespace velk_bench {

/// One process's part of a run.
struct Task {
  const Operation *operation;
  long links;     ///< In the database.
  int number;     ///< Of this process, from 0, ...
  int processes;  ///< ... and of all.
  double seconds;
  std::unique_ptr<Operations> (*open)();
};

/// Opens the side, warms up, waits at the barrier and calls the operation: on live links in random
/// order, the same for both sides, and on other links than the other processes.
Work Measure(const Task &task, const std::function<void()> &wait);

}  // namespace velk_bench

#endif
