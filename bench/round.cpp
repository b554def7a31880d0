#include "round.h"

#include "processes.h"
#include "worker.h"

namespace velk_bench {
namespace {

using Open = std::unique_ptr<Operations> (*)();

/// How often a single call is measured, each time in a new process on the same rows: a short one
/// alone says little.
int TriesOfSingleCall(long links) {
  if (links <= 10000) return 9;
  return links <= 100000 ? 3 : 1;
}

std::vector<Work> RunOnce(const Case &measured, double seconds, Open open, Stage &stage) {
  stage.Set(measured.links);
  if (measured.operation->writes) stage.Spoil();
  const auto reports =
      RunTogether(measured.processes, [&](int number, const std::function<void()> &wait) {
        return Packed(Measure(
            {measured.operation, measured.links, number, measured.processes, seconds, open}, wait));
      });
  std::vector<Work> processes;
  for (const std::string &report : reports) processes.push_back(Unpacked(report));
  return processes;
}

Measurement MeasureSide(const Case &measured, double seconds, Open open, Stage &stage) {
  std::vector<Work> processes = RunOnce(measured, seconds, open, stage);
  if (measured.operation->extent != Extent::kOnce) return Summary(processes);
  for (int tries = TriesOfSingleCall(measured.links); tries > 1; --tries)
    Append(processes[0], RunOnce(measured, seconds, open, stage)[0]);
  return Summary(processes);
}

}  // namespace

Round MeasureRound(const Case &measured, double seconds, Stage &stage) {
  Round round;
  const bool library_first = measured.rounds.size() % 2 == 0;
  if (library_first) round.library = MeasureSide(measured, seconds, OpenLibrary, stage);
  round.baseline = MeasureSide(measured, seconds, OpenBaseline, stage);
  if (!library_first) round.library = MeasureSide(measured, seconds, OpenLibrary, stage);
  return round;
}

}  // namespace velk_bench
