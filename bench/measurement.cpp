#include "measurement.h"

#include <algorithm>
#include <cstring>

namespace velk_bench {
namespace {

constexpr double kNanosecondsOfMicrosecond = 1e3;
constexpr double kNanosecondsOfSecond = 1e9;
constexpr double kMicrosecondsOfSecond = 1e6;
constexpr double kBytesOfMegabyte = 1024 * 1024;

template <typename T>
void Put(std::string &bytes, const T &value) {
  bytes.append(reinterpret_cast<const char *>(&value), sizeof value);
}

template <typename T>
void Take(const char *&at, T &value) {
  std::memcpy(&value, at, sizeof value);
  at += sizeof value;
}

/// The value below which lies this share of the values.
double Quantile(std::vector<double> values, double share) {
  if (values.empty()) return 0;
  const auto place = static_cast<size_t>(share * static_cast<double>(values.size() - 1));
  std::nth_element(values.begin(), values.begin() + static_cast<std::ptrdiff_t>(place),
                   values.end());
  return values[place];
}

double CallsPerSecond(const Work &work) {
  double nanoseconds = 0;
  for (const Sample &sample : work.samples) nanoseconds += static_cast<double>(sample.nanoseconds);
  return static_cast<double>(work.samples.size()) / nanoseconds * kNanosecondsOfSecond;
}

/// Puts the means over all calls, of what was summed up, in the place of the sums.
void DivideByCalls(Measurement &sums, double calls) {
  for (double Measurement::*sum : {&Measurement::user_us, &Measurement::system_us,
                                   &Measurement::written_bytes, &Measurement::flushes})
    sums.*sum /= calls;
}

}  // namespace

void Append(Work &work, const Work &later) {
  work.user_seconds += later.user_seconds;
  work.system_seconds += later.system_seconds;
  work.written_bytes += later.written_bytes;
  work.resident_bytes = std::max(work.resident_bytes, later.resident_bytes);
  work.errors += later.errors;
  work.samples.insert(work.samples.end(), later.samples.begin(), later.samples.end());
}

std::string Packed(const Work &work) {
  std::string bytes;
  Put(bytes, work.user_seconds);
  Put(bytes, work.system_seconds);
  Put(bytes, work.written_bytes);
  Put(bytes, work.resident_bytes);
  Put(bytes, work.errors);
  for (const Sample &sample : work.samples) Put(bytes, sample);
  return bytes;
}

Work Unpacked(const std::string &bytes) {
  Work work;
  const char *at = bytes.data();
  Take(at, work.user_seconds);
  Take(at, work.system_seconds);
  Take(at, work.written_bytes);
  Take(at, work.resident_bytes);
  Take(at, work.errors);
  const char *const end = bytes.data() + bytes.size();
  work.samples.resize(static_cast<size_t>(end - at) / sizeof(Sample));
  for (Sample &sample : work.samples) Take(at, sample);
  return work;
}

Measurement Summary(const std::vector<Work> &processes) {
  Measurement summary;
  std::vector<double> microseconds;
  std::vector<double> flushes;
  for (const Work &work : processes) {
    summary.calls_per_second += CallsPerSecond(work);
    summary.user_us += work.user_seconds * kMicrosecondsOfSecond;
    summary.system_us += work.system_seconds * kMicrosecondsOfSecond;
    summary.written_bytes += static_cast<double>(work.written_bytes);
    summary.errors += static_cast<double>(work.errors);
    const double resident = static_cast<double>(work.resident_bytes) / kBytesOfMegabyte;
    summary.resident_mb = std::max(summary.resident_mb, resident);
    for (const Sample &sample : work.samples) {
      microseconds.push_back(static_cast<double>(sample.nanoseconds) / kNanosecondsOfMicrosecond);
      flushes.push_back(static_cast<double>(sample.flushes));
      summary.flushes += flushes.back();
    }
  }
  DivideByCalls(summary, static_cast<double>(microseconds.size()));
  summary.typical_flushes = Median(std::move(flushes));
  summary.p99_us = Quantile(microseconds, 0.99);
  summary.p50_us = Median(std::move(microseconds));
  return summary;
}

double Median(std::vector<double> values) {
  return Quantile(std::move(values), 0.5);
}

}  // namespace velk_bench
