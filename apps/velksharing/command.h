#ifndef VELKSHARING_CLI_COMMAND_H
#define VELKSHARING_CLI_COMMAND_H

#include <CLI/CLI.hpp>
#include <functional>
#include <string>

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

/// Does `step` for every one of `items`; one that is refused is reported and the others are done.
template <typename Item, typename Step>
ExitStatus ForEach(const std::vector<Item> &items, Step step);

/// Reports a failure on standard error.
/// @return the exit status that goes with it.
ExitStatus Report(const operations::Failure &failure);

template <typename Item, typename Step>
ExitStatus ForEach(const std::vector<Item> &items, Step step) {
  ExitStatus status = EXIT_DONE;
  for (const Item &item : items) {
    try {
      step(item);
    } catch (const operations::Failure &failure) {
      status = std::max(status, Report(failure));
    }
  }
  return status;
}

// One command group each.
void AddLinkCommands(CLI::App &program, Request &request);
void AddSessionCommands(CLI::App &program, Request &request);
void AddTokenCommands(CLI::App &program, Request &request);
void AddBlockCommands(CLI::App &program, Request &request);
void AddVisitCommands(CLI::App &program, Request &request);
void AddDatabaseCommands(CLI::App &program, Request &request);

}  // namespace command_line

#endif
