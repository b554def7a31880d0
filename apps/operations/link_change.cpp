#include "operations/link_change.h"

#include <algorithm>

#include "gate/prefix.h"
#include "operations/accounts.h"
#include "operations/failure.h"
#include "operations/permissions.h"

namespace operations {
namespace {

using VELK::sharing::record::Entry;

std::string Listed(const std::vector<std::string> &names) {
  std::string text;
  for (const std::string &name : names) text += (text.empty() ? "“" : ", “") + name + "”";
  return text;
}

void RefuseUnknown(const char *kind, const std::vector<std::string> &unknown) {
  if (unknown.empty()) return;
  throw Failure(Failure::NOT_FOUND, std::string("this machine knows no ") + kind + " " +
                                        Listed(unknown) + "; unknown names would never count");
}

bool WantsAccounts(const LinkChange &change) {
  return change.users || change.groups;
}

void ForgetPassword(Entry &link) {
  link.set_protect_password("", false, Entry::ENCRYPT_ALGO_DEFAULT);
}

void ForgetAccounts(Entry &link) {
  link.set_protect_users({});
  link.set_protect_groups({});
}

void SetPassword(const Secret &password, Entry &link) {
  if (password.empty()) throw Failure(Failure::INVALID, "the password is empty");
  if (password.Contains('\0'))
    throw Failure(Failure::INVALID, "the password holds a zero byte, which nobody can type");
  std::string text(password.c_str(), password.length());
  link.set_protect_password(text, true, Entry::ENCRYPT_ALGO_DEFAULT);
  Wipe(text);
}

void SetAccounts(const LinkChange &change, Entry &link) {
  if (change.users) link.set_protect_users(*change.users);
  if (change.groups) link.set_protect_groups(*change.groups);
  const Permissions now = StoredPermissions(link);
  if (now.uids.empty() && now.gids.empty() && now.unknown_users.empty() &&
      now.unknown_groups.empty()) {
    throw Failure(Failure::INVALID, "a link for accounts must permit an account or a group");
  }
}

void ApplyProtection(const LinkChange &change, Entry &link) {
  const int kinds = change.open + change.password.has_value() + WantsAccounts(change);
  if (kinds > 1) {
    throw Failure(Failure::INVALID,
                  "a link is open, or has a password, or is for accounts and groups: choose one");
  }
  if (change.open) {
    ForgetPassword(link);
    ForgetAccounts(link);
    link.set_protect_type(Entry::PROTECT_NONE);
  }
  if (change.password) {
    ForgetAccounts(link);
    SetPassword(*change.password, link);
    link.set_protect_type(Entry::PROTECT_PASSWORD);
  }
  if (WantsAccounts(change)) {
    ForgetPassword(link);
    SetAccounts(change, link);
    link.set_protect_type(Entry::PROTECT_USER);
  }
  if (change.title) link.set_protect_title(*change.title);
}

void ApplyLimits(const LinkChange &change, Entry &link) {
  if (change.start_at) link.set_start_at(*change.start_at);
  if (change.expire_at) link.set_expire_at(*change.expire_at);
  if (change.expire_times) link.set_expire_times(*change.expire_times);
  if (change.match_ip) link.set_enable_match_ip(*change.match_ip);
  if (change.auto_remove) link.set_auto_gc(*change.auto_remove);
  const bool both = link.get_start_at() > 0 && link.get_expire_at() > 0;
  if ((change.start_at || change.expire_at) && both && link.get_expire_at() < link.get_start_at())
    throw Failure(Failure::INVALID, "the link would end before it starts");
}

void CheckPrefix(const std::string &text) {
  if (web::gate::Prefix::Parse(text)) return;
  throw Failure(Failure::INVALID, "“" + text +
                                      "” is nothing that a link can guard; it guards sites like "
                                      "“https://wiki.example/” and paths like “/photos/”");
}

void ApplyProtects(const std::vector<std::string> &prefixes, Entry &link) {
  Json::Value list(Json::arrayValue);
  for (const std::string &prefix : prefixes) {
    CheckPrefix(prefix);
    list.append(prefix);
  }
  Json::Value app = link.get_app();
  if (!app.isObject()) app = Json::Value(Json::objectValue);
  app.removeMember("protects");
  if (!list.empty()) app["protects"] = list;
  link.set_app(app);
}

bool HasControlCharacter(const std::string &text) {
  return std::any_of(text.begin(), text.end(),
                     [](unsigned char byte) { return byte < 0x20 || byte == 0x7f; });
}

void ApplyRedirect(const LinkChange &change, Entry &link) {
  if (!change.redirect_type && !change.redirect_uri) return;
  if (change.redirect_type) link.set_redirect_type(*change.redirect_type);
  const bool none = link.get_redirect_type() == Entry::REDIRECT_NONE;
  if (none && change.redirect_type) link.set_redirect_uri("");
  if (change.redirect_uri) link.set_redirect_uri(*change.redirect_uri);
  if (none && !link.get_redirect_uri().empty())
    throw Failure(Failure::INVALID, "a redirect target needs a kind of redirect other than none");
  if (!none && link.get_redirect_uri().empty())
    throw Failure(Failure::INVALID, "this kind of redirect needs a target");
  if (HasControlCharacter(link.get_redirect_uri()))
    throw Failure(Failure::INVALID, "a redirect target must not hold control characters");
}

}  // namespace

void CheckNames(const LinkChange &change) {
  if (change.allow_unknown) return;
  if (change.users) RefuseUnknown("account", UnknownAccounts(*change.users));
  if (change.groups) RefuseUnknown("group", UnknownGroups(*change.groups));
}

void Apply(const LinkChange &change, Entry &link) {
  if (change.project && change.project->empty())
    throw Failure(Failure::INVALID, "the project must not be empty");
  if (change.project) link.set_project_name(*change.project);
  if (change.owner_uid) link.set_owner_uid(*change.owner_uid);
  if (change.enabled) link.set_enabled(*change.enabled);
  if (change.app) link.set_app(*change.app);
  if (change.protects) ApplyProtects(*change.protects, link);
  if (change.private_data) link.set_private_data(*change.private_data);
  ApplyProtection(change, link);
  ApplyLimits(change, link);
  ApplyRedirect(change, link);
}

}  // namespace operations
