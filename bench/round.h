#ifndef BENCH_ROUND_H
#define BENCH_ROUND_H

#include "cases.h"
#include "stage.h"

namespace velk_bench {

/// Measures both sides of a case once. They take turns of a tenth of the time, so that whatever
/// else the machine does meanwhile meets both. Throws when a process fails.
/// @param seconds that each side is called.
Round MeasureRound(const Case &measured, double seconds, Stage &stage);

}  // namespace velk_bench

#endif
