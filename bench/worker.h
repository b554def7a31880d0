#ifndef BENCH_WORKER_H
#define BENCH_WORKER_H

#include <memory>

#include "cases.h"
#include "team.h"

namespace velk_bench {

/// One process's part of a run.
struct Task {
  const Operation *operation;
  long links;     ///< In the database.
  int number;     ///< Of this process, from 0, ...
  int processes;  ///< ... and of all.
  double warm_up_seconds;
  double turn_seconds;
  Side side;
};

/// Opens a side and warms up; then calls the operation as often as a turn has room for, on live
/// links in random order: the same for both sides, and others than the other processes'. Reports
/// packed Work. Names the process after its side, so that profilers tell them apart.
std::unique_ptr<Member> MakeWorker(const Task &task);

}  // namespace velk_bench

#endif
