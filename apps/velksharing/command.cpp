#include "command.h"

#include <climits>

#include "output.h"

namespace command_line {
namespace {

constexpr int kLargestPage = 100000;

std::string Footer(const std::string &example) {
  return "Example:\n  velksharing " + example;
}

}  // namespace

CLI::App *AddGroup(CLI::App &parent, const std::string &name, const std::string &description,
                   const std::string &example) {
  CLI::App *group = parent.add_subcommand(name, description);
  group->footer(Footer(example));
  group->require_subcommand(1);
  return group;
}

CLI::App *AddCommand(CLI::App &group, Request &request, const std::string &name,
                     const std::string &description, const std::string &example,
                     std::function<ExitStatus()> action) {
  CLI::App *command = group.add_subcommand(name, description);
  command->footer(Footer(example));
  command->add_flag("--json", request.json, "Print JSON for machines");
  command->callback([&request, action = std::move(action)] { request.action = action; });
  return command;
}

void PageOptions::AddTo(CLI::App &command) {
  auto *page = command.add_option("--page", page_, "Page to show, counted from 1")
                   ->check(CLI::Range(1L, static_cast<long>(INT_MAX)));
  auto *page_size =
      command.add_option("--page-size", page_size_, "Rows of a page; 50 when not given")
          ->check(CLI::Range(1, kLargestPage));
  auto *offset =
      command.add_option("--offset", offset_, "Rows to skip")->check(CLI::Range(0, INT_MAX));
  auto *limit = command.add_option("--limit", limit_, "Rows to show; 50 when not given")
                    ->check(CLI::Range(1, kLargestPage));
  for (CLI::Option *by_row : {offset, limit}) by_row->excludes(page)->excludes(page_size);
}

operations::Page PageOptions::ToPage() const {
  const bool by_row = offset_ != 0 || limit_ != 50;
  if (by_row) return {offset_, limit_};
  const long offset = (page_ - 1) * page_size_;
  if (offset > INT_MAX)
    throw operations::Failure(operations::Failure::INVALID, "there are no such pages");
  return {static_cast<int>(offset), page_size_};
}

ExitStatus Report(const operations::Failure &failure) {
  PrintError(failure.what());
  switch (failure.kind()) {
    case operations::Failure::NOT_FOUND:
    case operations::Failure::REFUSED:
      return EXIT_REFUSED;
    case operations::Failure::INVALID:
      return EXIT_USAGE;
    case operations::Failure::DATABASE:
    case operations::Failure::SYSTEM:
      return EXIT_BROKEN;
  }
  return EXIT_BROKEN;
}

void PrintDone(const std::vector<Done> &all, bool json) {
  if (!json) {
    for (const Done &done : all) PrintLine(done.line);
    return;
  }
  Json::Value list(Json::objectValue);
  list["done"] = Json::arrayValue;
  for (const Done &done : all) list["done"].append(done.json);
  PrintJson(list);
}

}  // namespace command_line
