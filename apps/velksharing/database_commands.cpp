#include <memory>

#include "command.h"
#include "operations/json_form.h"
#include "operations/maintenance.h"
#include "output.h"

namespace command_line {
namespace {

using namespace operations;

/// Rows named before the rest is only counted.
constexpr std::size_t kRowsNamed = 20;

std::string LinksText(const DatabaseStatus &status) {
  std::string text = std::to_string(status.links) + " (";
  for (std::size_t i = 0; i < kLinkStates.size(); ++i) {
    text += (i == 0 ? "" : ", ") + std::to_string(status.links_by_state[i]) + " " +
            LinkStateName(kLinkStates[i]);
  }
  return text + ")";
}

std::string LivesText(int live, int lapsed) {
  return std::to_string(live) + " live, " + std::to_string(lapsed) + " lapsed";
}

ExitStatus RunStatus(const Request &request) {
  const DatabaseStatus status = Status(*OpenForReading());
  if (request.json) {
    PrintJson(ToJson(status));
    return EXIT_DONE;
  }
  PrintDetails({
      {"path", status.path},
      {"version", std::to_string(status.version)},
      {"journal", status.journal_mode},
      {"database size", std::to_string(status.sizes.database) + " bytes"},
      {"log size", std::to_string(status.sizes.log) + " bytes"},
      {"links", LinksText(status)},
      {"sessions", LivesText(status.live_sessions, status.lapsed_sessions)},
      {"grants", LivesText(status.live_grants, status.lapsed_grants)},
  });
  return EXIT_DONE;
}

void PrintReport(const CheckReport &report) {
  for (const std::string &problem : report.problems) PrintLine("damage: " + problem);
  for (std::size_t i = 0; i < std::min(kRowsNamed, report.damaged_links.size()); ++i) {
    PrintLine("cannot be loaded: link " + std::to_string(report.damaged_links[i].id) + ", hash " +
              report.damaged_links[i].hash);
  }
  PrintLine(report.problems.empty() ? "the file is sound" : "the file is damaged");
  PrintLine(Counted(report.links, "link") + ", " + std::to_string(report.damaged_links.size()) +
            " of them cannot be loaded");
}

ExitStatus RunCheck(const Request &request) {
  const CheckReport report = CheckDatabase(*OpenForReading());
  if (request.json)
    PrintJson(ToJson(report));
  else
    PrintReport(report);
  if (!report.problems.empty()) return EXIT_BROKEN;
  return report.damaged_links.empty() ? EXIT_DONE : EXIT_REFUSED;
}

ExitStatus RunVacuum(const Request &request) {
  SharingDB &db = SharingDatabase();
  const FileSizes before = DatabaseSizes();
  Vacuum(db);
  const FileSizes after = DatabaseSizes();
  if (request.json) {
    Json::Value json(Json::objectValue);
    json["before"] = static_cast<Json::Int64>(before.database + before.log);
    json["after"] = static_cast<Json::Int64>(after.database + after.log);
    PrintJson(json);
  } else {
    PrintLine("from " + std::to_string(before.database + before.log) + " to " +
              std::to_string(after.database + after.log) + " bytes");
  }
  return EXIT_DONE;
}

ExitStatus RunBackup(const std::string &target, const Request &request) {
  BackUp(target);
  if (request.json) {
    Json::Value json(Json::objectValue);
    json["file"] = target;
    PrintJson(json);
  } else {
    PrintLine("written to " + target);
  }
  return EXIT_DONE;
}

void AddBackup(CLI::App &group, Request &request) {
  auto target = std::make_shared<std::string>();
  CLI::App *command = AddCommand(group, request, "backup",
                                 "Copy the database to a new file, consistent while others write",
                                 "db backup /srv/backup/sharing-monday.db",
                                 [target, &request] { return RunBackup(*target, request); });
  command->add_option("FILE", *target, "The file to make; must not exist")->required();
}

}  // namespace

void AddDatabaseCommands(CLI::App &program, Request &request) {
  CLI::App *group = AddGroup(program, "db", "The database", "db status");
  AddCommand(*group, request, "status", "Show version, sizes and counts", "db status",
             [&request] { return RunStatus(request); });
  AddCommand(*group, request, "check", "Check the file and try to load every link", "db check",
             [&request] { return RunCheck(request); });
  AddCommand(*group, request, "vacuum", "Rebuild the file without its free pages", "db vacuum",
             [&request] { return RunVacuum(request); });
  AddBackup(*group, request);
}

}  // namespace command_line
