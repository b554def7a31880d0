#ifndef BENCH_CASES_H
#define BENCH_CASES_H

#include <span>
#include <string>
#include <vector>

#include "measurement.h"
#include "operations.h"

namespace velk_bench {

/// How long an operation is called in one run.
enum class Extent {
  kTime,          ///< As long as the options say.
  kTimeOrSupply,  ///< That, or until each link had its turn, for each gives way to one call only.
  kOnce,          ///< One call, after which there is nothing left to do.
};

/// One operation. `call` is handed the id of a live link.
struct Operation {
  const char *name;
  bool (*call)(Operations &side, long id);
  Extent extent;
  bool writes;          ///< Leaves the database other than it was.
  bool also_with_four;  ///< Measured with four processes, too.
};

/// Both sides, measured in turns on the same rows.
struct Round {
  Measurement library;
  Measurement baseline;

  double Ratio() const { return library.calls_per_second / baseline.calls_per_second; }
};

/// One line of the table, and the rounds that were measured for it.
struct Case {
  const Operation *operation;
  long links;
  int processes;
  std::vector<Round> rounds;

  std::string Name() const;  ///< "check/links:1000/processes:4"
};

/// The medians over the rounds; of errors, the sum.
double MedianRatio(const Case &measured);
Measurement MedianOfLibrary(const Case &measured);
Measurement MedianOfBaseline(const Case &measured);

/// Everything that can be measured.
std::span<const Operation> AllOperations();

/// Everything that is measured at these numbers of links.
std::vector<Case> AllCases(const std::vector<long> &link_counts);

/// The case, if it has been measured; else null.
const Case *FindMeasured(const std::vector<Case> &cases, const std::string &operation, long links,
                         int processes = 1);

}  // namespace velk_bench

#endif
