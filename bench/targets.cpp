#include "targets.h"

#include <algorithm>
#include <optional>
#include <string>

#include "text_table.h"

namespace velk_bench {
namespace {

constexpr long kLinks = 100000;
constexpr long kFewLinks = 10000;
constexpr long kManyLinks = 1000000;
constexpr double kMicrosecondsOfMillisecond = 1000;

using Cases = std::vector<Case>;
using Reached = std::optional<double>;

Reached RatioOf(const Cases &cases, const char *operation, long links) {
  const Case *found = FindMeasured(cases, operation, links);
  if (found == nullptr) return std::nullopt;
  return MedianRatio(*found);
}

/// How many times as long as the baseline it takes.
Reached TimesOf(const Cases &cases, const char *operation, long links) {
  const Reached ratio = RatioOf(cases, operation, links);
  if (!ratio) return std::nullopt;
  return 1 / *ratio;
}

Reached FigureOf(const Cases &cases, const char *operation, int processes,
                 double Measurement::*figure) {
  const Case *found = FindMeasured(cases, operation, kLinks, processes);
  if (found == nullptr) return std::nullopt;
  return MedianOfLibrary(*found).*figure;
}

Reached Quotient(const Reached &dividend, const Reached &divisor) {
  if (!dividend || !divisor) return std::nullopt;
  return *dividend / *divisor;
}

Reached ErrorsOfAll(const Cases &cases) {
  Reached sum;
  for (const Case &measured : cases) {
    for (const Round &round : measured.rounds) sum = sum.value_or(0) + round.library.errors;
  }
  return sum;
}

/// The lines of the table.
class Targets {
 public:
  void AtLeast(const char *what, double wanted, const Reached &reached) {
    Add(what, "≥ ", wanted, reached, reached >= wanted);
  }
  void AtMost(const char *what, double wanted, const Reached &reached) {
    Add(what, "≤ ", wanted, reached, reached <= wanted);
  }
  void Exactly(const char *what, double wanted, const Reached &reached) {
    Add(what, "", wanted, reached, reached == wanted);
  }
  void Print(std::ostream &out) const { table_.Print(out); }

 private:
  void Add(const char *what, const char *relation, double wanted, const Reached &reached,
           bool enough) {
    if (!reached) return table_.Add({what, relation + NumberText(wanted), "not measured", ""});
    table_.Add({what, relation + NumberText(wanted), RatioText(*reached), enough ? "yes" : "no"});
  }

  TextTable table_{{"target (100,000 links unless said)", "wanted", "reached", "enough"}};
};

}  // namespace

void PrintTargets(const std::vector<Case> &cases, std::ostream &out) {
  const auto per_second = &Measurement::calls_per_second;
  Targets targets;
  targets.AtLeast("check: ratio", 0.85, RatioOf(cases, "check", kLinks));
  targets.AtLeast("login: ratio", 0.80, RatioOf(cases, "login", kLinks));
  targets.AtLeast("the check's reads: ratio", 0.75, RatioOf(cases, "check_reads", kLinks));

  targets.AtLeast(
      "check: four processes together against one", 1,
      Quotient(FigureOf(cases, "check", 4, per_second), FigureOf(cases, "check", 1, per_second)));
  const Reached p99 = FigureOf(cases, "check", 4, &Measurement::p99_us);
  targets.AtMost("check: p99 of four processes, ms", 50, Quotient(p99, kMicrosecondsOfMillisecond));
  targets.Exactly("errors of the library, all runs", 0, ErrorsOfAll(cases));

  targets.AtMost("check: growth from 10,000 links, without the baseline's", 1.1,
                 Quotient(RatioOf(cases, "check", kFewLinks), RatioOf(cases, "check", kLinks)));
  targets.Exactly("flushes of a check", 0,
                  FigureOf(cases, "check", 1, &Measurement::typical_flushes));
  targets.Exactly("flushes of a login", 1,
                  FigureOf(cases, "login", 1, &Measurement::typical_flushes));
  targets.AtMost("check: resident memory, MB", 40,
                 FigureOf(cases, "check", 1, &Measurement::resident_mb));

  targets.AtMost("purge of 100,000 of 1,000,000 links: times the DELETE", 1.3,
                 TimesOf(cases, "purge_links", kManyLinks));
  targets.AtMost("purge of 100,000 of 1,000,000 sessions: times the DELETE", 1.3,
                 TimesOf(cases, "purge_sessions", kManyLinks));
  targets.AtMost("purge of 100,000 of 1,000,000 grants: times the DELETE", 1.3,
                 TimesOf(cases, "purge_grants", kManyLinks));
  targets.AtMost("page of 1,000 of 1,000,000 links: times SELECT and JSON", 2,
                 TimesOf(cases, "list_1000", kManyLinks));
  targets.AtMost("page of 1,000 of 1,000,000 links: times SELECT alone", 2,
                 TimesOf(cases, "list_1000_bare", kManyLinks));
  targets.Print(out);
}

}  // namespace velk_bench
