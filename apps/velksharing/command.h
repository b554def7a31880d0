#ifndef VELKSHARING_CLI_COMMAND_H
#define VELKSHARING_CLI_COMMAND_H

#include <json/value.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <functional>
#include <string>
#include <vector>

#include "operations/database.h"

/// What all commands share: how they are announced to the parser, and how they end.

namespace command_line {

/// How the program ends.
enum ExitStatus {
  EXIT_DONE = 0,
  EXIT_REFUSED = 1,  ///< Refused, or something that was named does not exist.
  EXIT_USAGE = 2,    ///< The command line makes no sense.
  EXIT_BROKEN = 3    ///< The database or the system failed.
};

/// What the command line asks for. Lives as long as the parser.
struct Request {
  bool json = false;
  std::function<ExitStatus()> action;  ///< Run when the whole command line was understood.
};

/// A group of commands.
CLI::App *AddGroup(CLI::App &parent, const std::string &name, const std::string &description,
                   const std::string &example);

/// A command with --json. `action` runs after the parse.
CLI::App *AddCommand(CLI::App &group, Request &request, const std::string &name,
                     const std::string &description, const std::string &example,
                     std::function<ExitStatus()> action);

/// --page and --page-size, or --offset and --limit.
class PageOptions {
 public:
  void AddTo(CLI::App &command);
  operations::Page ToPage() const;

 private:
  long page_ = 1;
  int page_size_ = 50;
  int offset_ = 0;
  int limit_ = 50;
};

/// Reports a failure on standard error.
/// @return the exit status that goes with it.
ExitStatus Report(const operations::Failure &failure);

/// What was done to one of several things.
struct Done {
  Json::Value json;  ///< For machines.
  std::string line;  ///< For people.
};

/// One line for each, or all in the member "done" of an object.
void PrintDone(const std::vector<Done> &all, bool json);

/// Does `step`, which gives a Done, for every one of `items` and prints what was done. One that
/// fails is reported, and the others are done all the same.
template <typename Item, typename Step>
ExitStatus ForEach(const std::vector<Item> &items, const Request &request, Step step) {
  ExitStatus status = EXIT_DONE;
  std::vector<Done> all;
  for (const Item &item : items) {
    try {
      all.push_back(step(item));
    } catch (const operations::Failure &failure) {
      status = std::max(status, Report(failure));
    }
  }
  PrintDone(all, request.json);
  return status;
}

/// `link log`, which goes into the group of links.
void AddLinkLogCommand(CLI::App &group, Request &request);

// One command group each.
void AddLinkCommands(CLI::App &program, Request &request);
void AddSessionCommands(CLI::App &program, Request &request);
void AddTokenCommands(CLI::App &program, Request &request);
void AddBlockCommands(CLI::App &program, Request &request);
void AddVisitCommands(CLI::App &program, Request &request);
void AddDatabaseCommands(CLI::App &program, Request &request);

}  // namespace command_line

#endif
