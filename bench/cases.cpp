#include "cases.h"

#include <algorithm>

namespace velk_bench {
namespace {

constexpr int kSeveralProcesses = 4;

constexpr Operation kOperations[] = {
    {"login", [](Operations &side, long id) { return side.Login(VisitOf(id)); }, Extent::kTime,
     true, true},
    {"check", [](Operations &side, long id) { return side.Check(VisitOf(id)); }, Extent::kTime,
     true, true},
    {"check_reads", [](Operations &side, long id) { return side.ReadForCheck(VisitOf(id)); },
     Extent::kTime, false, true},
    {"logout", [](Operations &side, long id) { return side.Logout(VisitOf(id)); },
     Extent::kTimeOrSupply, true, true},
    {"use_count", [](Operations &side, long id) { return side.CountUse(VisitOf(id)); },
     Extent::kTime, true, true},
    {"create", [](Operations &side, long id) { return side.Create(id); }, Extent::kTime, true,
     true},
    {"list_1000", [](Operations &side, long) { return side.List(); }, Extent::kTime, false, false},
    {"list_1000_bare", [](Operations &side, long) { return side.ListAgainstBareSelect(); },
     Extent::kTime, false, false},
    {"purge_links", [](Operations &side, long) { return side.PurgeLinks(); }, Extent::kOnce, true,
     false},
    {"purge_owner", [](Operations &side, long) { return side.PurgeLinksOfOwnerProject(); },
     Extent::kOnce, true, false},
    {"purge_sessions", [](Operations &side, long) { return side.PurgeSessions(); }, Extent::kOnce,
     true, false},
    {"purge_grants", [](Operations &side, long) { return side.PurgeGrants(); }, Extent::kOnce, true,
     false},
};

Measurement MedianOf(const Case &measured, Measurement Round::*side) {
  Measurement median;
  for (const Figure &figure : kFigures) {
    std::vector<double> values;
    for (const Round &round : measured.rounds) values.push_back(round.*side.*figure.value);
    median.*figure.value = Median(std::move(values));
  }
  median.errors = 0;  // of these, none may go unseen
  for (const Round &round : measured.rounds) median.errors += (round.*side).errors;
  return median;
}

}  // namespace

std::string Case::Name() const {
  return std::string(operation->name) + "/links:" + std::to_string(links) +
         "/processes:" + std::to_string(processes);
}

double MedianRatio(const Case &measured) {
  std::vector<double> ratios;
  for (const Round &round : measured.rounds) ratios.push_back(round.Ratio());
  return Median(std::move(ratios));
}

Measurement MedianOfLibrary(const Case &measured) {
  return MedianOf(measured, &Round::library);
}

Measurement MedianOfBaseline(const Case &measured) {
  return MedianOf(measured, &Round::baseline);
}

std::span<const Operation> AllOperations() {
  return kOperations;
}

std::vector<Case> AllCases(const std::vector<long> &link_counts) {
  std::vector<Case> cases;
  for (const Operation &operation : kOperations) {
    for (const long links : link_counts) {
      cases.push_back({&operation, links, 1, {}});
      if (operation.also_with_four) cases.push_back({&operation, links, kSeveralProcesses, {}});
    }
  }
  return cases;
}

const Case *FindMeasured(const std::vector<Case> &cases, const std::string &operation, long links,
                         int processes) {
  const auto found = std::find_if(cases.begin(), cases.end(), [&](const Case &candidate) {
    return candidate.operation->name == operation && candidate.links == links &&
           candidate.processes == processes && !candidate.rounds.empty();
  });
  return found == cases.end() ? nullptr : &*found;
}

}  // namespace velk_bench
