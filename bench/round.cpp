#include "round.h"

#include "processes.h"
#include "worker.h"

namespace velk_bench {
namespace {

Measurement MeasureSide(const Case &measured, double seconds, std::unique_ptr<Operations> (*open)(),
                        Stage &stage) {
  stage.Set(measured.links);
  if (measured.operation->writes) stage.Spoil();
  const auto reports =
      RunTogether(measured.processes, [&](int number, const std::function<void()> &wait) {
        return Packed(Measure(
            {measured.operation, measured.links, number, measured.processes, seconds, open}, wait));
      });
  std::vector<Work> processes;
  for (const std::string &report : reports) processes.push_back(Unpacked(report));
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
