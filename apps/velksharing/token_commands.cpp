#include <climits>
#include <memory>

#include "command.h"
#include "operations/json_form.h"
#include "operations/moment.h"
#include "operations/sessions.h"
#include "output.h"
#include "text_option.h"

namespace command_line {
namespace {

using namespace operations;

struct ListOptions {
  TextOption hash;
  int session_id = 0;
  PageOptions page;
};

void PrintGrants(const GrantList &list) {
  Table table({"ID", "LINK", "SESSION", "LAPSES"});
  for (const Grant &grant : list.grants) {
    table.AddRow(
        {std::to_string(grant.token.get_id()), grant.hash.empty() ? "(deleted)" : grant.hash,
         std::to_string(grant.token.get_session_id()), MomentText(grant.token.get_timeout())});
  }
  table.Print();
  PrintLine(std::to_string(list.grants.size()) + " of " + Counted(list.total, "live grant") + "; " +
            std::to_string(list.lapsed) + " lapsed");
}

ExitStatus List(const ListOptions &options, const Request &request) {
  GrantQuery query;
  query.hash = options.hash.value();
  if (options.session_id != 0) query.session_id = options.session_id;
  query.page = options.page.ToPage();
  const GrantList list = ListGrants(SharingDatabase(), query);
  if (request.json)
    PrintJson(ToJson(list, query.page));
  else
    PrintGrants(list);
  return EXIT_DONE;
}

void AddList(CLI::App &group, Request &request) {
  auto options = std::make_shared<ListOptions>();
  CLI::App *command = AddCommand(group, request, "list", "List live grants, the newest first",
                                 "token list --link aB3xK9pQ2",
                                 [options, &request] { return List(*options, request); });
  options->hash.AddTo(*command, "--link", "HASH", "Only on this link");
  command->add_option("--session", options->session_id, "Only of the session with this row id")
      ->type_name("ID")
      ->check(CLI::Range(1, INT_MAX));
  options->page.AddTo(*command);
}

ExitStatus Delete(const std::vector<int> &ids, const Request &request) {
  SharingDB &db = SharingDatabase();
  return ForEach(ids, request, [&](int id) {
    DeleteGrant(db, id);
    return Done{id, "grant " + std::to_string(id) + " deleted"};
  });
}

void AddDelete(CLI::App &group, Request &request) {
  auto ids = std::make_shared<std::vector<int>>();
  CLI::App *command = AddCommand(
      group, request, "delete", "Delete grants: their visitors must log in to that link again",
      "token delete 23", [ids, &request] { return Delete(*ids, request); });
  command->add_option("ID", *ids, "Row ids, as the list shows them")
      ->required()
      ->check(CLI::Range(1, INT_MAX));
}

}  // namespace

void AddTokenCommands(CLI::App &program, Request &request) {
  CLI::App *group =
      AddGroup(program, "token", "Grants: which session may use which link", "token list");
  AddList(*group, request);
  AddDelete(*group, request);
  AddCommand(*group, request, "purge", "Remove lapsed grants", "token purge", [&request] {
    PrintRemoval(PurgeGrants(SharingDatabase()), "grant", request.json);
    return EXIT_DONE;
  });
}

}  // namespace command_line
