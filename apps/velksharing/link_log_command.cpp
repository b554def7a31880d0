#include <chrono>
#include <climits>
#include <cstring>
#include <iostream>
#include <memory>
#include <thread>

#include "command.h"
#include "operations/accounts.h"
#include "operations/audit_log.h"
#include "operations/json_document.h"
#include "operations/links.h"
#include "operations/moment.h"
#include "output.h"
#include "text_option.h"
#include "time_input.h"

namespace command_line {
namespace {

using namespace operations;

constexpr std::chrono::milliseconds kBetweenLooks{500};
constexpr int64_t kMicroseconds = 1'000'000;

struct LogOptions {
  TextOption hash, since;
  int id = 0;
  int limit = 0;
  bool follow = false;
};

/// Lines of a table that has no end: the widths cannot wait for what is yet to come.
void PrintColumns(const char *time, const char *event, const char *result,
                  const std::string &address, const std::string &account) {
  char line[128] = "";
  snprintf(line, sizeof(line), "%-19s  %-6s  %-15s  %-18s  ", time, event, result, address.c_str());
  std::string text = line + account;
  text.erase(text.find_last_not_of(' ') + 1);
  PrintLine(text);
}

void PrintRecord(const audit::Record &record) {
  PrintColumns(MomentText(record.time / kMicroseconds).c_str(), EventName(record.event),
               ResultName(record), record.address, record.uid ? AccountText(*record.uid) : "");
}

void PrintRecordJson(const audit::Record &record) {
  std::cout << JsonLine(ToJson(record)) << '\n';
}

/// "7d" and the like: so long ago. Else a moment.
long ParseSince(const std::string &text) {
  const bool is_duration = !text.empty() && text.find_first_of("-:@+") == std::string::npos &&
                           strchr("smhdw", text.back()) != nullptr;
  return is_duration ? Now() - ParseDuration(text) : ParseMoment(text, Now());
}

AuditQuery ToQuery(const LogOptions &options) {
  if (options.hash.given() == (options.id != 0))
    throw Failure(Failure::INVALID, "either HASH or --id names the link");
  AuditQuery query;
  if (options.since.given()) query.since = ParseSince(*options.since.value());
  if (options.limit != 0) query.limit = options.limit;
  query.entry_id =
      options.id != 0 ? options.id : FindLinkId(SharingDatabase(), *options.hash.value());
  return query;
}

ExitStatus Log(const LogOptions &options, const Request &request) {
  AuditLog log(ToQuery(options));
  const auto print = request.json ? &PrintRecordJson : &PrintRecord;
  bool has_headings = request.json;
  const auto print_under_headings = [&](const audit::Record &record) {
    if (!has_headings) PrintColumns("TIME", "EVENT", "RESULT", "ADDRESS", "ACCOUNT");
    has_headings = true;
    print(record);
  };
  if (!log.Read(print_under_headings) && !options.follow) throw NoAuditTrail();
  // Until somebody ends the program, or nobody reads what it prints.
  while (options.follow && std::cout.flush()) {
    std::this_thread::sleep_for(kBetweenLooks);
    log.Read(print_under_headings);
  }
  return EXIT_DONE;
}

}  // namespace

void AddLinkLogCommand(CLI::App &group, Request &request) {
  auto options = std::make_shared<LogOptions>();
  CLI::App *command = AddCommand(group, request, "log", "List who came, the oldest first",
                                 "link log aB3xK9pQ2 --since 7d --follow",
                                 [options, &request] { return Log(*options, request); });
  CLI::Option *hash = options->hash.AddTo(*command, "HASH", "", "The link");
  command->add_option("--id", options->id, "The link's row id, also of one that was deleted")
      ->type_name("ID")
      ->check(CLI::Range(1, INT_MAX))
      ->excludes(hash);
  options->since.AddTo(*command, "--since", "TIME", "Only from then on; 7d means for seven days");
  command->add_option("--limit", options->limit, "Only the last ones, so many")
      ->type_name("N")
      ->check(CLI::Range(1, INT_MAX));
  command->add_flag("--follow", options->follow, "Go on with those who come, until interrupted");
}

}  // namespace command_line
