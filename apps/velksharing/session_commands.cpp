#include <climits>
#include <memory>

#include "command.h"
#include "operations/accounts.h"
#include "operations/address.h"
#include "operations/json_form.h"
#include "operations/moment.h"
#include "operations/sessions.h"
#include "output.h"
#include "text_option.h"

namespace command_line {
namespace {

using namespace operations;

struct ListOptions {
  TextOption user, address;
  PageOptions page;
};

void PrintSessions(const SessionList &list) {
  Table table({"ID", "SESSION", "ACCOUNT", "ADDRESS", "LAPSES"});
  for (const Session &session : list.sessions) {
    table.AddRow({std::to_string(session.get_id()), ShortIdentifier(session),
                  AccountText(session.get_uid()), session.get_ip(),
                  MomentText(session.get_timeout())});
  }
  table.Print();
  PrintLine(std::to_string(list.sessions.size()) + " of " + Counted(list.total, "live session") +
            "; " + std::to_string(list.lapsed) + " lapsed");
}

ExitStatus List(const ListOptions &options, const Request &request) {
  SessionQuery query;
  if (options.user.given()) query.uid = ResolveAccount(*options.user.value());
  if (options.address.given()) query.address = ParseAddress(*options.address.value());
  query.page = options.page.ToPage();
  const SessionList list = ListSessions(SharingDatabase(), query);
  if (request.json)
    PrintJson(ToJson(list, query.page));
  else
    PrintSessions(list);
  return EXIT_DONE;
}

void AddList(CLI::App &group, Request &request) {
  auto options = std::make_shared<ListOptions>();
  CLI::App *command = AddCommand(group, request, "list", "List live sessions, the newest first",
                                 "session list --user ann",
                                 [options, &request] { return List(*options, request); });
  options->user.AddTo(*command, "--user", "USER", "Only this account's");
  options->address.AddTo(*command, "--ip", "ADDRESS", "Only from this address");
  options->page.AddTo(*command);
}

ExitStatus Delete(const std::vector<int> &ids, const Request &request) {
  SharingDB &db = SharingDatabase();
  return ForEach(ids, request, [&](int id) {
    DeleteSession(db, id);
    return Done{id, "session " + std::to_string(id) + " deleted"};
  });
}

void AddDelete(CLI::App &group, Request &request) {
  auto ids = std::make_shared<std::vector<int>>();
  CLI::App *command =
      AddCommand(group, request, "delete", "Delete sessions: their visitors are logged out",
                 "session delete 17", [ids, &request] { return Delete(*ids, request); });
  command->add_option("ID", *ids, "Row ids, as the list shows them")
      ->required()
      ->check(CLI::Range(1, INT_MAX));
}

}  // namespace

void AddSessionCommands(CLI::App &program, Request &request) {
  CLI::App *group = AddGroup(program, "session", "Visitors' sessions", "session list");
  AddList(*group, request);
  AddDelete(*group, request);
  AddCommand(*group, request, "purge", "Remove lapsed sessions", "session purge", [&request] {
    PrintRemoval(PurgeSessions(SharingDatabase()), "session", request.json);
    return EXIT_DONE;
  });
}

}  // namespace command_line
