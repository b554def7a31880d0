#include "report.h"

#include <sqlite3.h>
#include <sys/utsname.h>

#include <algorithm>
#include <ctime>

#include "targets.h"
#include "text_table.h"

namespace velk_bench {
namespace {

std::string Today() {
  const time_t now = time(nullptr);
  char text[32];
  return std::string(text, strftime(text, sizeof text, "%Y-%m-%d", gmtime(&now)));
}

/// "0.873 (0.860–0.881)": the median, the lowest and the highest of the rounds.
std::string RatioWithSpread(const Case &measured) {
  std::vector<double> ratios;
  for (const Round &round : measured.rounds) ratios.push_back(round.Ratio());
  const auto [lowest, highest] = std::minmax_element(ratios.begin(), ratios.end());
  return RatioText(MedianRatio(measured)) + " (" + RatioText(*lowest) + "–" + RatioText(*highest) +
         ")";
}

void AppendFigures(std::vector<std::string> &cells, const Measurement &figures) {
  for (const double figure : {figures.p50_us, figures.p99_us, figures.user_us, figures.system_us,
                              figures.resident_mb, figures.written_bytes})
    cells.push_back(NumberText(figure));
  cells.push_back(RatioText(figures.flushes));
  cells.push_back(NumberText(figures.errors));
}

}  // namespace

bool Report::ReportContext(const Context &context) {
  utsname system{};
  uname(&system);
  GetOutputStream() << Today() << ", " << context.cpu_info.num_cpus << " CPUs at "
                    << static_cast<int>(context.cpu_info.cycles_per_second / 1e6) << " MHz, "
                    << system.sysname << ' ' << system.release << ", SQLite "
                    << sqlite3_libversion();
  if (!context.cpu_info.load_avg.empty())
    GetOutputStream() << ", load before " << NumberText(context.cpu_info.load_avg[0]);
  GetOutputStream() << "\n\n";
  return true;
}

void Report::ReportRuns(const std::vector<Run> &runs) {
  for (const Run &run : runs) {
    if (!run.error_occurred) continue;
    has_failures_ = true;
    GetErrorStream() << run.benchmark_name() << ": " << run.error_message << '\n';
  }
}

void Report::Finalize() {
  PrintCases();
  GetOutputStream() << '\n';
  PrintTargets(cases_, GetOutputStream());
}

void Report::PrintCases() {
  TextTable table({"operation", "links", "proc.", "side", "calls/s", "ratio (min–max)", "p50 µs",
                   "p99 µs", "user µs", "sys µs", "MB", "bytes", "flushes", "errors"});
  for (const Case &measured : cases_) {
    if (measured.rounds.empty()) continue;
    const Measurement library = MedianOfLibrary(measured);
    const Measurement baseline = MedianOfBaseline(measured);
    std::vector<std::string> first = {measured.operation->name,
                                      NumberText(static_cast<double>(measured.links)),
                                      std::to_string(measured.processes),
                                      kLibrary.name,
                                      NumberText(library.calls_per_second),
                                      RatioWithSpread(measured)};
    std::vector<std::string> second = {
        "", "", "", kBaseline.name, NumberText(baseline.calls_per_second), ""};
    AppendFigures(first, library);
    AppendFigures(second, baseline);
    table.Add(std::move(first));
    table.Add(std::move(second));
    has_failures_ = has_failures_ || library.errors + baseline.errors > 0;
  }
  table.Print(GetOutputStream());
}

}  // namespace velk_bench
