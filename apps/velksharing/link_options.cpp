#include "link_options.h"

#include <charconv>

#include "operations/accounts.h"
#include "operations/failure.h"
#include "operations/json_document.h"
#include "operations/moment.h"
#include "time_input.h"

namespace command_line {
namespace {

using operations::Failure;
using operations::LinkChange;
using VELK::sharing::record::Entry;

Entry::RedirectType ParseRedirect(const std::string &name) {
  if (name == "none") return Entry::REDIRECT_NONE;
  return name == "always" ? Entry::REDIRECT_ALWAYS : Entry::REDIRECT_URLPARAM;
}

int ParseUses(const std::string &text) {
  if (text == "unlimited") return 0;
  int uses = 0;
  const char *end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, uses);
  if (error == std::errc() && rest == end && uses > 0) return uses;
  throw Failure(Failure::INVALID, "“" + text + "” is not a number of uses");
}

/// The pair of flags "yes" and "no" of one choice.
std::optional<bool> Choice(bool yes, bool no) {
  if (!yes && !no) return std::nullopt;
  return yes;
}

}  // namespace

void LinkOptions::AddTo(CLI::App &command) {
  AddIdentity(command);
  AddProtection(command);
  AddLimits(command);
  AddRedirect(command);
  AddDocuments(command);
}

void LinkOptions::AddClearingTo(CLI::App &command) {
  CLI::Option *open = command.add_flag("--open", open_, "Take every protection away");
  open->excludes(ask_password_option_)
      ->excludes(password_source_.from_input())
      ->excludes(password_source_.from_file())
      ->excludes(users_option_)
      ->excludes(groups_option_);
  command.add_flag("--no-users", no_users_, "Permit no single account any more")
      ->excludes(users_option_)
      ->excludes(open);
  command.add_flag("--no-groups", no_groups_, "Permit no group any more")
      ->excludes(groups_option_)
      ->excludes(open);
}

void LinkOptions::AddIdentity(CLI::App &command) {
  project_option_ = command.add_option("--project", project_, "Application that shares");
  owner_option_ =
      command.add_option("--owner", owner_, "Account on whose behalf is shared")->type_name("USER");
  title_option_ = command.add_option("--title", title_, "Title shown with the prompt");
}

void LinkOptions::AddProtection(CLI::App &command) {
  ask_password_option_ =
      command.add_flag("--password", ask_password_, "Protect by a password, asked for here");
  password_source_.AddTo(command);
  users_option_ = command.add_option("--user", users_, "Permit an account; may be repeated")
                      ->type_name("USER")
                      ->allow_extra_args(false);
  groups_option_ = command.add_option("--group", groups_, "Permit a group; may be repeated")
                       ->type_name("GROUP")
                       ->allow_extra_args(false);
  command.add_flag("--allow-unknown", allow_unknown_,
                   "Accept names that this machine does not know; they never count");

  const auto passwords = {ask_password_option_, password_source_.from_input(),
                          password_source_.from_file()};
  for (CLI::Option *password : passwords)
    password->excludes(users_option_)->excludes(groups_option_);
  ask_password_option_->excludes(password_source_.from_input())
      ->excludes(password_source_.from_file());
}

void LinkOptions::AddLimits(CLI::App &command) {
  start_option_ = command
                      .add_option("--start", start_,
                                  "Usable from this moment: \"2026-12-31 18:00\", RFC 3339, "
                                  "@seconds, +2h; never: no start")
                      ->type_name("TIME");
  expire_option_ =
      command
          .add_option("--expire", expire_, "Usable until this moment, as --start; never: no end")
          ->type_name("TIME");
  uses_option_ =
      command.add_option("--uses", uses_, "Number of logins allowed, or unlimited")->type_name("N");
  auto *match = command.add_flag("--match-ip", match_ip_,
                                 "Hold a visitor to the address of the login (as a new link does)");
  command.add_flag("--no-match-ip", no_match_ip_, "Let a visitor change the address")
      ->excludes(match);
  auto *remove =
      command.add_flag("--auto-remove", auto_remove_,
                       "Let automatic purges remove it once expired (as for a new link)");
  command.add_flag("--keep", keep_, "Keep it from automatic purges")->excludes(remove);
}

void LinkOptions::AddRedirect(CLI::App &command) {
  redirect_option_ = command.add_option("--redirect", redirect_, "Where a visitor is sent")
                         ->type_name("KIND")
                         ->check(CLI::IsMember({"none", "url_param", "always"}));
  redirect_uri_option_ =
      command.add_option("--redirect-uri", redirect_uri_, "Target of the redirect")
          ->type_name("URI");
}

void LinkOptions::AddDocuments(CLI::App &command) {
  app_option_ =
      command.add_option("--app", app_, "The application's data, a JSON object")->type_name("JSON");
  path_option_ = command.add_option("--path", path_, "Short for --app '{\"path\": PATH}'")
                     ->type_name("PATH")
                     ->excludes(app_option_);
  private_data_option_ =
      command
          .add_option("--private-data", private_data_,
                      "Data of the application that front ends do not show, a JSON object")
          ->type_name("JSON");
}

LinkChange LinkOptions::ToChange() const {
  LinkChange change;
  if (project_option_->count() != 0) change.project = project_;
  if (owner_option_->count() != 0) change.owner_uid = operations::ResolveAccount(owner_);
  if (title_option_->count() != 0) change.title = title_;
  ReadLimits(change);
  ReadRedirect(change);
  ReadDocuments(change);
  ReadProtection(change);
  return change;
}

void LinkOptions::ReadProtection(LinkChange &change) const {
  change.open = open_;
  change.allow_unknown = allow_unknown_;
  if (!users_.empty() || no_users_) change.users = users_;
  if (!groups_.empty() || no_groups_) change.groups = groups_;
  change.password = password_source_.Read();
  if (ask_password_) change.password = AskNewSecret("Password of the link");
}

void LinkOptions::ReadLimits(LinkChange &change) const {
  const long now = operations::Now();
  if (start_option_->count() != 0) change.start_at = ParseLimit(start_, now);
  if (expire_option_->count() != 0) change.expire_at = ParseLimit(expire_, now);
  if (uses_option_->count() != 0) change.expire_times = ParseUses(uses_);
  change.match_ip = Choice(match_ip_, no_match_ip_);
  change.auto_remove = Choice(auto_remove_, keep_);
}

void LinkOptions::ReadRedirect(LinkChange &change) const {
  if (redirect_option_->count() != 0) change.redirect_type = ParseRedirect(redirect_);
  if (redirect_uri_option_->count() != 0) change.redirect_uri = redirect_uri_;
}

void LinkOptions::ReadDocuments(LinkChange &change) const {
  if (app_option_->count() != 0) change.app = operations::ParseJsonObject("--app", app_);
  if (path_option_->count() != 0) {
    Json::Value app(Json::objectValue);
    app["path"] = path_;
    change.app = app;
  }
  if (private_data_option_->count() != 0)
    change.private_data = operations::ParseJsonObject("--private-data", private_data_);
}

}  // namespace command_line
