#ifndef BENCH_FLUSH_COUNTER_H
#define BENCH_FLUSH_COUNTER_H

/// Counts how often this process waits for the disk. The program's own fsync() and fdatasync()
/// stand before those of the C library, so that SQLite calls them; they count and do the real
/// thing.

namespace velk_bench {

/// Flushes of this process so far.
long FlushesSoFar();

/// Makes SQLite flush a file in `folder`, and throws when that was not counted.
void RequireFlushesAreCounted(const char *folder);

}  // namespace velk_bench

#endif
