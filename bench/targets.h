#ifndef BENCH_TARGETS_H
#define BENCH_TARGETS_H

#include <ostream>
#include <vector>

#include "cases.h"

namespace velk_bench {

/// Prints what is to be reached, what is, and whether that is enough. What was not measured says
/// so.
void PrintTargets(const std::vector<Case> &cases, std::ostream &out);

}  // namespace velk_bench

#endif
