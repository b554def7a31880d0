#include "worker.h"

#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <exception>
#include <fstream>
#include <random>
#include <stdexcept>

#include "flush_counter.h"

namespace velk_bench {
namespace {

using Clock = std::chrono::steady_clock;

constexpr int kWarmUpCallsOfSupply = 10;  // what is used up then is not there to be measured
constexpr double kWarmUpShare = 0.5;      // of the time that is measured

/// The live links of one process, each once and then again from the start.
class Turns {
 public:
  Turns(long links, int number, int processes) {
    for (long id = 1; id <= links; ++id) {
      if (IsLive(id) && id % processes == number) ids_.push_back(static_cast<int>(id));
    }
    std::shuffle(ids_.begin(), ids_.end(), std::mt19937(20260701U + static_cast<unsigned>(number)));
  }

  long Next() { return ids_[next_++ % ids_.size()]; }
  bool HasGoneRound() const { return next_ >= ids_.size(); }

 private:
  std::vector<int> ids_;
  size_t next_ = 0;
};

/// A number from one of the files in /proc/self, which look like "name: number".
std::int64_t ProcessFigure(const char *path, const std::string &name) {
  std::ifstream file(path);
  for (std::string word; file >> word;) {
    std::int64_t number = 0;
    if (word == name && file >> number) return number;
  }
  throw std::runtime_error(std::string(path) + " has no " + name);
}

std::int64_t WrittenBytes() {
  return ProcessFigure("/proc/self/io", "wchar:");
}

std::int64_t MostResidentBytes() {
  return 1024 * ProcessFigure("/proc/self/status", "VmHWM:");
}

double Seconds(const timeval &time) {
  return static_cast<double>(time.tv_sec) + 1e-6 * static_cast<double>(time.tv_usec);
}

/// Turns what a process has used so far into what it uses from the construction on.
class Meter {
 public:
  Meter() : written_(WrittenBytes()) { getrusage(RUSAGE_SELF, &usage_); }

  void ReadTo(Work &work) const {
    rusage now{};
    getrusage(RUSAGE_SELF, &now);
    work.user_seconds = Seconds(now.ru_utime) - Seconds(usage_.ru_utime);
    work.system_seconds = Seconds(now.ru_stime) - Seconds(usage_.ru_stime);
    work.written_bytes = WrittenBytes() - written_;
    work.resident_bytes = MostResidentBytes();
  }

 private:
  std::int64_t written_;
  rusage usage_{};
};

bool CallOnce(const Operation &operation, Operations &side, long id) {
  try {
    return operation.call(side, id);
  } catch (const std::exception &) {
    return false;
  }
}

void WarmUp(const Task &task, Operations &side, Turns &turns) {
  if (task.operation->extent == Extent::kOnce) {
    side.ReadForCheck(VisitOf(turns.Next()));  // opens the log
    return;
  }
  const bool is_scarce = task.operation->extent == Extent::kTimeOrSupply;
  const auto end = Clock::now() + std::chrono::duration<double>(kWarmUpShare * task.seconds);
  for (int call = 0; Clock::now() < end && !(is_scarce && call == kWarmUpCallsOfSupply); ++call)
    CallOnce(*task.operation, side, turns.Next());
}

bool IsOver(const Task &task, const Turns &turns, Clock::time_point end) {
  if (task.operation->extent == Extent::kOnce || Clock::now() >= end) return true;
  return task.operation->extent == Extent::kTimeOrSupply && turns.HasGoneRound();
}

void CallUntilOver(const Task &task, Operations &side, Turns &turns, Work &work) {
  const auto end = Clock::now() + std::chrono::duration_cast<Clock::duration>(
                                      std::chrono::duration<double>(task.seconds));
  do {
    const long id = turns.Next();
    const long flushes = FlushesSoFar();
    const auto start = Clock::now();
    const bool done = CallOnce(*task.operation, side, id);
    const std::chrono::nanoseconds spent = Clock::now() - start;
    work.samples.push_back({spent.count(), FlushesSoFar() - flushes});
    if (!done) ++work.errors;
  } while (!IsOver(task, turns, end));
}

}  // namespace

Work Measure(const Task &task, const std::function<void()> &wait) {
  setenv("REMOTE_ADDR", kVisitorAddress, 1);
  Turns turns(task.links, task.number, task.processes);
  const std::unique_ptr<Operations> side = task.open();
  WarmUp(task, *side, turns);
  wait();

  Work work;
  const Meter meter;
  CallUntilOver(task, *side, turns, work);
  meter.ReadTo(work);
  return work;
}

}  // namespace velk_bench
