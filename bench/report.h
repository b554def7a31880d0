#ifndef BENCH_REPORT_H
#define BENCH_REPORT_H

#include <benchmark/benchmark.h>

#include <vector>

#include "cases.h"

namespace velk_bench {

/// What Google Benchmark reports to: prints nothing but the tables, at the end. The cases' rounds
/// hold the figures; from the runs it takes only what failed.
class Report : public benchmark::BenchmarkReporter {
 public:
  /// @param cases must outlive the report.
  explicit Report(const std::vector<Case> &cases) : cases_(cases) {}

  bool ReportContext(const Context &context) override;
  void ReportRuns(const std::vector<Run> &runs) override;
  void Finalize() override;

  /// Whether a case could not be measured, or a call of one did not do its work.
  bool HasFailures() const { return has_failures_; }

 private:
  void PrintCases();

  const std::vector<Case> &cases_;
  bool has_failures_ = false;
};

}  // namespace velk_bench

#endif
