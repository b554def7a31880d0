#ifndef BENCH_MEASUREMENT_H
#define BENCH_MEASUREMENT_H

#include <cstdint>
#include <string>
#include <vector>

namespace velk_bench {

/// One call.
struct Sample {
  std::int64_t nanoseconds;
  std::int64_t flushes;
};

/// What one process did between the barrier and its last call.
struct Work {
  double user_seconds = 0;
  double system_seconds = 0;
  std::int64_t written_bytes = 0;   ///< As the process handed them to the kernel.
  std::int64_t resident_bytes = 0;  ///< The most that it ever had.
  std::int64_t errors = 0;          ///< Calls that did not do their work.
  std::vector<Sample> samples;      ///< One for each call, failed ones included.
};

/// Adds what another process did after it.
void Append(Work &work, const Work &later);

/// For the pipe between two processes of this program.
std::string Packed(const Work &work);
Work Unpacked(const std::string &bytes);

/// One side's figures of one run, all processes together.
struct Measurement {
  double calls_per_second = 0;  ///< Calls by the time spent in them; summed up over processes.
  double p50_us = 0;
  double p99_us = 0;
  double user_us = 0;  ///< For each call, as all that follow.
  double system_us = 0;
  double resident_mb = 0;  ///< Of the largest process.
  double written_bytes = 0;
  double flushes = 0;          ///< The mean, with those of checkpoints.
  double typical_flushes = 0;  ///< The median: a call without a checkpoint.
  double errors = 0;           ///< The sum.
};
Measurement Summary(const std::vector<Work> &processes);

/// A figure and its name, for whatever goes through all of them.
struct Figure {
  const char *name;
  double Measurement::*value;
};
inline constexpr Figure kFigures[] = {
    {"calls_per_second", &Measurement::calls_per_second},
    {"p50_us", &Measurement::p50_us},
    {"p99_us", &Measurement::p99_us},
    {"user_us_per_call", &Measurement::user_us},
    {"system_us_per_call", &Measurement::system_us},
    {"resident_mb", &Measurement::resident_mb},
    {"written_bytes_per_call", &Measurement::written_bytes},
    {"flushes_per_call", &Measurement::flushes},
    {"typical_flushes_of_a_call", &Measurement::typical_flushes},
    {"errors", &Measurement::errors},
};

/// Half of the values are not above it. 0 without values.
double Median(std::vector<double> values);

}  // namespace velk_bench

#endif
