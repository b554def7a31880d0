#ifndef VELKSHARING_CLI_PASSWORD_INPUT_H
#define VELKSHARING_CLI_PASSWORD_INPUT_H

#include <CLI/CLI.hpp>
#include <optional>
#include <string>

#include "operations/secret.h"

/// Passwords and session identifiers from where no other user of the machine can see them: never
/// from an argument. A line ends with "\n" or "\r\n". All throw Failure: INVALID for an unfit text,
/// SYSTEM when it cannot be read.

namespace command_line {

using operations::Secret;

/// Asks on the terminal, without showing what is typed.
Secret AskSecret(const std::string &question);

/// Asks twice, until both answers are the same; gives up after three times.
Secret AskNewSecret(const std::string &question);

/// The first line of standard input, without its end.
Secret ReadSecretFromInput();

/// The first line of a file, without its end.
Secret ReadSecretFromFile(const std::string &path);

/// --password-stdin and --password-file, at most one.
class PasswordSource {
 public:
  void AddTo(CLI::App &command);

  /// The password where an option names its source.
  std::optional<Secret> Read() const;

  CLI::Option *from_input() const { return from_input_option_; }
  CLI::Option *from_file() const { return from_file_option_; }

 private:
  bool from_input_ = false;
  std::string file_;
  CLI::Option *from_input_option_ = nullptr;
  CLI::Option *from_file_option_ = nullptr;
};

}  // namespace command_line

#endif
