#include "link_options.h"

#include <charconv>

#include "operations/accounts.h"
#include "operations/failure.h"
#include "operations/json_document.h"
#include "operations/json_form.h"
#include "operations/moment.h"
#include "time_input.h"

namespace command_line {
namespace {

using operations::Failure;
using operations::LinkChange;

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
  command.add_flag("--no-protects", no_protects_, "Guard nothing any more")
      ->excludes(protects_option_);
}

void LinkOptions::AddIdentity(CLI::App &command) {
  project_.AddTo(command, "--project", "NAME", "Application that shares");
  owner_.AddTo(command, "--owner", "USER", "Account on whose behalf is shared");
  title_.AddTo(command, "--title", "TEXT", "Title shown with the prompt");
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
  start_.AddTo(command, "--start", "TIME",
               "Usable from this moment: \"2026-12-31 18:00\", RFC 3339, @seconds, +2h; "
               "never: no start");
  expire_.AddTo(command, "--expire", "TIME", "Usable until this moment, as --start; never: no end");
  uses_.AddTo(command, "--uses", "N", "Number of logins allowed, or unlimited");
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
  redirect_.AddTo(command, "--redirect", "KIND", "Where a visitor is sent")
      ->check(CLI::IsMember({"none", "url_param", "always"}));
  redirect_uri_.AddTo(command, "--redirect-uri", "URI", "Target of the redirect");
}

void LinkOptions::AddDocuments(CLI::App &command) {
  CLI::Option *app = app_.AddTo(command, "--app", "JSON", "The application's data, a JSON object");
  path_.AddTo(command, "--path", "PATH", "Short for --app '{\"path\": PATH}'")->excludes(app);
  protects_option_ = command
                         .add_option("--protects", protects_,
                                     "Guard an application at this address, such as "
                                     "https://wiki.example/ or /photos/; may be repeated")
                         ->type_name("PREFIX")
                         ->allow_extra_args(false)
                         ->excludes(app);
  private_data_.AddTo(command, "--private-data", "JSON",
                      "Data of the application that front ends do not show, a JSON object");
}

LinkChange LinkOptions::ToChange() const {
  LinkChange change;
  change.project = project_.value();
  if (owner_.given()) change.owner_uid = operations::ResolveAccount(*owner_.value());
  change.title = title_.value();
  ReadLimits(change);
  ReadRedirect(change);
  ReadDocuments(change);
  ReadProtection(change);
  return change;
}

std::optional<Secret> LinkOptions::ReadPassword() const {
  return ask_password_ ? AskNewSecret("Password of the link") : password_source_.Read();
}

void LinkOptions::ReadProtection(LinkChange &change) const {
  change.open = open_;
  change.allow_unknown = allow_unknown_;
  if (!users_.empty() || no_users_) change.users = users_;
  if (!groups_.empty() || no_groups_) change.groups = groups_;
}

void LinkOptions::ReadLimits(LinkChange &change) const {
  const long now = operations::Now();
  if (start_.given()) change.start_at = ParseLimit(*start_.value(), now);
  if (expire_.given()) change.expire_at = ParseLimit(*expire_.value(), now);
  if (uses_.given()) change.expire_times = ParseUses(*uses_.value());
  change.match_ip = Choice(match_ip_, no_match_ip_);
  change.auto_remove = Choice(auto_remove_, keep_);
}

void LinkOptions::ReadRedirect(LinkChange &change) const {
  if (redirect_.given())
    change.redirect_type = operations::RedirectTypeFromName(*redirect_.value());
  change.redirect_uri = redirect_uri_.value();
}

void LinkOptions::ReadDocuments(LinkChange &change) const {
  if (app_.given()) change.app = operations::ParseJsonObject("--app", *app_.value());
  if (path_.given()) {
    Json::Value app(Json::objectValue);
    app["path"] = *path_.value();
    change.app = app;
  }
  if (!protects_.empty() || no_protects_) change.protects = protects_;
  if (private_data_.given())
    change.private_data = operations::ParseJsonObject("--private-data", *private_data_.value());
}

}  // namespace command_line
