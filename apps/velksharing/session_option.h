#ifndef VELKSHARING_CLI_SESSION_OPTION_H
#define VELKSHARING_CLI_SESSION_OPTION_H

#include <CLI/CLI.hpp>
#include <optional>
#include <string>

#include "operations/secret.h"

namespace command_line {

/// --session and --session-file: the identifier of a visitor's session. The file is for machines
/// whose other users may read arguments.
class SessionOption {
 public:
  void AddTo(CLI::App &command);

  /// Whether one of the two must be given.
  void Require() { required_ = true; }

  /// @throws operations::Failure INVALID, SYSTEM.
  std::optional<operations::Secret> Read() const;

 private:
  std::string identifier_;
  std::string file_;
  bool required_ = false;
  CLI::Option *identifier_option_ = nullptr;
  CLI::Option *file_option_ = nullptr;
};

}  // namespace command_line

#endif
