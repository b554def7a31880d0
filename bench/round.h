#ifndef BENCH_ROUND_H
#define BENCH_ROUND_H

#include "cases.h"
#include "stage.h"

namespace velk_bench {

/// Measures both sides of a case once, right after each other. Which goes first changes from round
/// to round. Throws when a process fails.
/// @param seconds that each side is called.
Round MeasureRound(const Case &measured, double seconds, Stage &stage);

}  // namespace velk_bench

#endif
