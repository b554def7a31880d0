#ifndef BENCH_OPTIONS_H
#define BENCH_OPTIONS_H

#include <string>
#include <vector>

namespace velk_bench {

struct Options {
  std::vector<long> link_counts = {1000, 10000, 100000};
  double seconds = 1;  ///< That one side is called in one round.
  /// What is left for Google Benchmark, the program's name first, after our own defaults for it.
  std::vector<std::string> others;
};

/// --large adds 1,000,000 links. --quick measures 1,000 links, once and hardly long enough to see
/// that everything works. --seconds=S sets the time.
Options TakeOptions(int argc, char **argv);

}  // namespace velk_bench

#endif
