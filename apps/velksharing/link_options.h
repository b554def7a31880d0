#ifndef VELKSHARING_CLI_LINK_OPTIONS_H
#define VELKSHARING_CLI_LINK_OPTIONS_H

#include <CLI/CLI.hpp>
#include <optional>
#include <string>
#include <vector>

#include "operations/link_change.h"
#include "password_input.h"
#include "text_option.h"

namespace command_line {

/// The options that describe a link, for making and for changing one.
class LinkOptions {
 public:
  /// What both commands offer.
  void AddTo(CLI::App &command);
  /// What only makes sense for a link that exists.
  void AddClearingTo(CLI::App &command);

  CLI::Option *project() const { return project_.option(); }

  /// What the options ask for, but for the password.
  /// @throws operations::Failure.
  operations::LinkChange ToChange() const;

  /// The password where one is wanted: read, or asked for.
  /// @throws operations::Failure.
  std::optional<Secret> ReadPassword() const;

 private:
  void AddIdentity(CLI::App &command);
  void AddProtection(CLI::App &command);
  void AddLimits(CLI::App &command);
  void AddRedirect(CLI::App &command);
  void AddDocuments(CLI::App &command);

  void ReadProtection(operations::LinkChange &change) const;
  void ReadLimits(operations::LinkChange &change) const;
  void ReadRedirect(operations::LinkChange &change) const;
  void ReadDocuments(operations::LinkChange &change) const;

  TextOption project_, owner_, title_, start_, expire_, uses_, redirect_, redirect_uri_;
  TextOption app_, path_, private_data_;
  std::vector<std::string> users_, groups_, protects_;
  bool ask_password_ = false;
  bool allow_unknown_ = false;
  bool open_ = false;
  bool no_users_ = false;
  bool no_groups_ = false;
  bool no_protects_ = false;
  bool match_ip_ = false;
  bool no_match_ip_ = false;
  bool auto_remove_ = false;
  bool keep_ = false;
  PasswordSource password_source_;

  CLI::Option *ask_password_option_ = nullptr;
  CLI::Option *users_option_ = nullptr;
  CLI::Option *groups_option_ = nullptr;
  CLI::Option *protects_option_ = nullptr;
};

}  // namespace command_line

#endif
