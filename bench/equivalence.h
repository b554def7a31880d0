#ifndef BENCH_EQUIVALENCE_H
#define BENCH_EQUIVALENCE_H

#include "stage.h"

namespace velk_bench {

/// Runs each operation that writes, on both sides, and compares what the database then holds: every
/// column of every row, but for what is random and the second in which a time-out was renewed.
/// Throws when it is not the same, for then there is nothing to be measured.
void RequireSameEffects(Stage &stage);

}  // namespace velk_bench

#endif
