#ifndef VELKSHARING_CLI_TEXT_OPTION_H
#define VELKSHARING_CLI_TEXT_OPTION_H

#include <CLI/CLI.hpp>
#include <optional>
#include <string>

namespace command_line {

/// An option with a text that may be empty: "--owner ''" is not the same as no --owner, least of
/// all for a purge. Must not move after AddTo().
class TextOption {
 public:
  /// @param type_name what the help calls the text: "USER".
  CLI::Option *AddTo(CLI::App &command, const std::string &name, const std::string &type_name,
                     const std::string &description) {
    option_ = command.add_option(name, text_, description)->type_name(type_name);
    return option_;
  }

  /// The text; nothing when the option was not given.
  std::optional<std::string> value() const { return given() ? std::optional(text_) : std::nullopt; }

  bool given() const { return option_ != nullptr && option_->count() != 0; }
  CLI::Option *option() const { return option_; }

 private:
  std::string text_;
  CLI::Option *option_ = nullptr;
};

}  // namespace command_line

#endif
