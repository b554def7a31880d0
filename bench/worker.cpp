#include "worker.h"

#include <sys/prctl.h>
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

Clock::duration Duration(double seconds) {
  return std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
}

double Seconds(const timeval &time) {
  return static_cast<double>(time.tv_sec) + 1e-6 * static_cast<double>(time.tv_usec);
}

/// What a process uses from the construction on.
class Meter {
 public:
  Meter() : written_(WrittenBytes()) { getrusage(RUSAGE_SELF, &usage_); }

  void AddTo(Work &work) const {
    rusage now{};
    getrusage(RUSAGE_SELF, &now);
    work.user_seconds += Seconds(now.ru_utime) - Seconds(usage_.ru_utime);
    work.system_seconds += Seconds(now.ru_stime) - Seconds(usage_.ru_stime);
    work.written_bytes += WrittenBytes() - written_;
  }

 private:
  std::int64_t written_;
  rusage usage_{};
};

class Worker : public Member {
 public:
  explicit Worker(const Task &task)
      : task_(task), turns_(task.links, task.number, task.processes), side_(task.side.open()) {
    WarmUp();
  }

  void Turn() override {
    const Meter meter;
    const auto end = Clock::now() + Duration(task_.turn_seconds);
    do {
      if (IsUsedUp()) break;
      MeasureCall();
    } while (task_.operation->extent != Extent::kOnce && Clock::now() < end);
    meter.AddTo(work_);
  }

  std::string Report() override {
    work_.resident_bytes = MostResidentBytes();
    return Packed(work_);
  }

 private:
  void WarmUp() {
    if (task_.operation->extent == Extent::kOnce) {
      side_->ReadForCheck(VisitOf(turns_.Next()));  // opens the log
      return;
    }
    const bool is_scarce = task_.operation->extent == Extent::kTimeOrSupply;
    const auto end = Clock::now() + Duration(task_.warm_up_seconds);
    for (int calls = 0; Clock::now() < end && !(is_scarce && calls == kWarmUpCallsOfSupply);
         ++calls)
      Call(turns_.Next());
  }

  bool IsUsedUp() const {
    return task_.operation->extent == Extent::kTimeOrSupply && turns_.HasGoneRound();
  }

  void MeasureCall() {
    const long id = turns_.Next();
    const long flushes = FlushesSoFar();
    const auto start = Clock::now();
    const bool done = Call(id);
    const std::chrono::nanoseconds spent = Clock::now() - start;
    work_.samples.push_back({spent.count(), FlushesSoFar() - flushes});
    if (!done) ++work_.errors;
  }

  bool Call(long id) {
    try {
      return task_.operation->call(*side_, id);
    } catch (const std::exception &) {
      return false;
    }
  }

  const Task task_;
  Turns turns_;
  const std::unique_ptr<Operations> side_;
  Work work_;
};

}  // namespace

std::unique_ptr<Member> MakeWorker(const Task &task) {
  prctl(PR_SET_NAME, task.side.name);
  setenv("REMOTE_ADDR", kVisitorAddress, 1);
  return std::make_unique<Worker>(task);
}

}  // namespace velk_bench
