#include "session_option.h"

#include "operations/failure.h"
#include "password_input.h"

namespace command_line {

using operations::Failure;

void SessionOption::AddTo(CLI::App &command) {
  identifier_option_ =
      command.add_option("--session", identifier_, "Identifier of the visitor's session")
          ->type_name("ID");
  file_option_ =
      command.add_option("--session-file", file_, "Read the identifier from a file's first line")
          ->type_name("FILE")
          ->excludes(identifier_option_);
}

std::optional<Secret> SessionOption::Read() const {
  if (file_option_->count() != 0) return ReadSecretFromFile(file_);
  if (identifier_option_->count() == 0 && required_)
    throw Failure(Failure::INVALID, "--session or --session-file is needed");
  if (identifier_option_->count() == 0) return std::nullopt;
  Secret identifier;
  for (const char byte : identifier_) {
    if (!identifier.Append(byte))
      throw Failure(Failure::INVALID, "the session's identifier is too long");
  }
  return identifier;
}

}  // namespace command_line
