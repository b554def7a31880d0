// Measures the library beside the same work done straight on SQLite. README.md tells how.

#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cstdio>
#include <exception>

#include "cases.h"
#include "equivalence.h"
#include "options.h"
#include "report.h"
#include "round.h"
#include "stage.h"

namespace {

using velk_bench::Case;
using velk_bench::Figure;
using velk_bench::Measurement;
using velk_bench::Options;
using velk_bench::Report;
using velk_bench::Round;
using velk_bench::Stage;

/// For --benchmark_out.
void Count(benchmark::State &state, const std::string &side, const Measurement &figures) {
  for (const Figure &figure : velk_bench::kFigures)
    state.counters[side + figure.name] = figures.*figure.value;
}

void ShowProgress(const Case &measured) {
  if (isatty(STDERR_FILENO) == 0) return;
  std::fprintf(stderr, "\r\033[K%s, round %zu\r", measured.Name().c_str(),
               measured.rounds.size() + 1);
}

/// One iteration is one round.
void Run(benchmark::State &state, Case &measured, double seconds, Stage &stage) {
  for (auto iteration : state) {
    (void)iteration;
    ShowProgress(measured);
    try {
      const Round round = velk_bench::MeasureRound(measured, seconds, stage);
      measured.rounds.push_back(round);
      state.SetIterationTime(1 / round.library.calls_per_second);
      state.counters["ratio"] = round.Ratio();
      Count(state, "library_", round.library);
      Count(state, "baseline_", round.baseline);
    } catch (const std::exception &error) {
      state.SkipWithError(error.what());
      break;
    }
  }
}

void Register(std::vector<Case> &cases, double seconds, Stage &stage) {
  for (Case &measured : cases) {
    benchmark::RegisterBenchmark(measured.Name().c_str(),
                                 [&measured, seconds, &stage](benchmark::State &state) {
                                   Run(state, measured, seconds, stage);
                                 })
        ->Iterations(1)
        ->UseManualTime()
        ->Unit(benchmark::kMicrosecond);
  }
}

/// Whether all options were understood.
bool Initialize(Options &options) {
  std::vector<char *> arguments;
  for (std::string &argument : options.others) arguments.push_back(argument.data());
  int count = static_cast<int>(arguments.size());
  arguments.push_back(nullptr);
  benchmark::Initialize(&count, arguments.data());
  return !benchmark::ReportUnrecognizedArguments(count, arguments.data());
}

int Measure(Options options) {
  if (!Initialize(options)) return 2;
  Stage stage;
  velk_bench::RequireSameEffects(stage);
  std::vector<Case> cases = velk_bench::AllCases(options.link_counts);
  Register(cases, options.seconds, stage);
  Report report(cases);
  const bool found_any = benchmark::RunSpecifiedBenchmarks(&report) > 0;
  return found_any && !report.HasFailures() ? 0 : 1;
}

}  // namespace

int main(int argc, char **argv) {
  try {
    return Measure(velk_bench::TakeOptions(argc, argv));
  } catch (const std::exception &error) {
    std::fprintf(stderr, "velksharing_bench: %s\n", error.what());
    return 2;
  }
}
