#ifndef VELKSHARING_WEB_WATCH_COUNTERS_H
#define VELKSHARING_WEB_WATCH_COUNTERS_H

#include <atomic>
#include <cstdint>

#include "watch/labels.h"
#include "watch/witness.h"

namespace web::watch {

using Counter = std::atomic<uint64_t>;

/// All counters. They only grow, and begin at 0.
struct CounterTable {
  Counter requests[kRoutes][std::size(kStatuses)][std::size(kResults)];
  Counter times[kRoutes][kBucketLimits.size() + 1];
  Counter time_sums[kRoutes];  ///< Microseconds.
  Counter refused_logins[std::size(kResults)];
  Counter replaced_workers;
  Counter replaced_observers;
  Counter kept_records;
  Counter records_without_room;  ///< Lost because the observer did not take them in.
  Counter records_not_stored;    ///< Lost because the file could not be written.
};

/// The counters of all processes that are forked after it was made: each adds to the same memory,
/// without a lock, and what a process has counted outlives it.
class Counters {
 public:
  /// @throws std::runtime_error when there is no memory.
  Counters();
  Counters(const Counters &) = delete;
  Counters &operator=(const Counters &) = delete;
  ~Counters();

  void Count(const Finished &request);

  CounterTable &table() { return *table_; }
  const CounterTable &table() const { return *table_; }

 private:
  CounterTable *table_;
};

/// Adds to a counter. What is counted orders nothing else, so this need not either.
inline void Add(Counter &counter, uint64_t count = 1) {
  counter.fetch_add(count, std::memory_order_relaxed);
}

inline uint64_t Value(const Counter &counter) {
  return counter.load(std::memory_order_relaxed);
}

}  // namespace web::watch

#endif
