#include <memory>

#include "command.h"
#include "operations/blocks.h"
#include "operations/json_form.h"
#include "operations/moment.h"
#include "output.h"
#include "text_option.h"
#include "time_input.h"

namespace command_line {
namespace {

using namespace operations;

std::string StateText(const Block &block) {
  if (!block.blocked) return "failing";
  return block.blocked_until == 0 ? "blocked for ever"
                                  : "blocked until " + MomentText(block.blocked_until);
}

ExitStatus List(bool with_failing, const Request &request) {
  const std::vector<Block> blocks = ListBlocks(with_failing);
  if (request.json) {
    PrintJson(ToJson(blocks));
    return EXIT_DONE;
  }
  Table table({"ADDRESS", "STATE", "FAILURES", "LAST FAILURE", "CATEGORY"});
  for (const Block &block : blocks) {
    table.AddRow({block.address, StateText(block), std::to_string(block.attempts),
                  MomentText(block.last_failure), block.category});
  }
  table.Print();
  return EXIT_DONE;
}

void AddList(CLI::App &group, Request &request) {
  auto all = std::make_shared<bool>(false);
  CLI::App *command = AddCommand(group, request, "list", "List blocked addresses", "block list",
                                 [all, &request] { return List(*all, request); });
  command->add_flag("--all", *all, "Also addresses that have failed but are not blocked");
}

struct AddOptions {
  std::vector<std::string> addresses;
  TextOption duration;
};

ExitStatus Add(const AddOptions &options, const Request &request) {
  const long seconds = options.duration.given() ? ParseDuration(*options.duration.value()) : 0;
  return ForEach(options.addresses, request, [&](const std::string &address) {
    AddBlock(address, seconds);
    return Done{address, address + " blocked"};
  });
}

void AddAdd(CLI::App &group, Request &request) {
  auto options = std::make_shared<AddOptions>();
  CLI::App *command =
      AddCommand(group, request, "add", "Block addresses", "block add 203.0.113.7 --for 7d",
                 [options, &request] { return Add(*options, request); });
  command->add_option("ADDRESS", options->addresses, "IPv4 or IPv6; IPv6 counts by its /64")
      ->required();
  options->duration.AddTo(*command, "--for", "DURATION",
                          "How long: 30m, 2h, 7d; for ever when not given");
}

ExitStatus Remove(const std::vector<std::string> &addresses, const Request &request) {
  return ForEach(addresses, request, [](const std::string &address) {
    RemoveBlock(address);
    return Done{address, address + " forgotten"};
  });
}

void AddRemove(CLI::App &group, Request &request) {
  auto addresses = std::make_shared<std::vector<std::string>>();
  CLI::App *command = AddCommand(
      group, request, "remove", "Forget the block and the failures of addresses",
      "block remove 203.0.113.7", [addresses, &request] { return Remove(*addresses, request); });
  command->add_option("ADDRESS", *addresses, "IPv4 or IPv6; IPv6 counts by its /64")->required();
}

}  // namespace

void AddBlockCommands(CLI::App &program, Request &request) {
  CLI::App *group =
      AddGroup(program, "block", "Addresses that are blocked for failing logins", "block list");
  AddList(*group, request);
  AddAdd(*group, request);
  AddRemove(*group, request);
}

}  // namespace command_line
