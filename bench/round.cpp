#include "round.h"

#include "worker.h"

namespace velk_bench {
namespace {

constexpr int kTurns = 10;
constexpr double kWarmUpShare = 0.5;

/// What each process of the two sides did.
struct Works {
  std::vector<Work> library;
  std::vector<Work> baseline;
};

std::vector<Work> Finish(Team &team) {
  std::vector<Work> works;
  for (const std::string &report : team.Finish()) works.push_back(Unpacked(report));
  return works;
}

/// Who begins changes from turn to turn.
void TakeTurns(Team &library, Team &baseline, int turns, bool library_begins) {
  for (int turn = 0; turn < turns; ++turn) {
    Team &first = library_begins ? library : baseline;
    Team &second = library_begins ? baseline : library;
    first.Turn();
    second.Turn();
    library_begins = !library_begins;
  }
}

Works Run(const Case &measured, double seconds, bool library_begins, Stage &stage) {
  const auto team_of = [&](const Side &side) {
    return [&measured, seconds, side](int number) {
      return MakeWorker({measured.operation, measured.links, number, measured.processes,
                         kWarmUpShare * seconds, seconds / kTurns, side});
    };
  };
  stage.Set(measured.links);
  if (measured.operation->writes) stage.Spoil();
  Team library(measured.processes, team_of(kLibrary));
  Team baseline(measured.processes, team_of(kBaseline));
  TakeTurns(library, baseline, measured.operation->extent == Extent::kOnce ? 1 : kTurns,
            library_begins);
  return {Finish(library), Finish(baseline)};
}

/// How often a single call is measured, each time in new processes on the same rows: a short one
/// alone says little.
int TriesOfSingleCall(long links) {
  if (links <= 10000) return 10;
  return links <= 100000 ? 4 : 1;
}

Works RunSingleCalls(const Case &measured, bool library_begins, Stage &stage) {
  Works works = Run(measured, 0, library_begins, stage);
  for (int tries = TriesOfSingleCall(measured.links); tries > 1; --tries) {
    library_begins = !library_begins;
    const Works more = Run(measured, 0, library_begins, stage);
    Append(works.library[0], more.library[0]);
    Append(works.baseline[0], more.baseline[0]);
  }
  return works;
}

}  // namespace

Round MeasureRound(const Case &measured, double seconds, Stage &stage) {
  const bool library_begins = measured.rounds.size() % 2 == 0;
  const Works works = measured.operation->extent == Extent::kOnce
                          ? RunSingleCalls(measured, library_begins, stage)
                          : Run(measured, seconds, library_begins, stage);
  return {Summary(works.library), Summary(works.baseline)};
}

}  // namespace velk_bench
