#include "operations/accounts.h"

#include <charconv>

#include "operations/failure.h"
#include "velksharing/constants.h"
#include "velksharing/utils.h"

namespace operations {
namespace {

bool ParseUid(const std::string &text, unsigned int &uid) {
  const char *end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, uid);
  return error == std::errc() && rest == end && uid != VELK::sharing::UID_ERR;
}

template <typename Lookup>
std::vector<std::string> Unknown(const std::vector<std::string> &names, Lookup lookup) {
  std::vector<std::string> unknown;
  for (const std::string &name : names) {
    unsigned int id = 0;
    if (!lookup(name, id)) unknown.push_back(name);
  }
  return unknown;
}

}  // namespace

unsigned int ResolveAccount(const std::string &text) {
  unsigned int uid = 0;
  if (VELK::sharing::UserToUID(text, uid) || ParseUid(text, uid)) return uid;
  throw Failure(Failure::NOT_FOUND, "there is no account “" + text + "”");
}

std::string AccountText(unsigned int uid) {
  if (uid == VELK::sharing::UID_ERR) return "";
  std::string name;
  return VELK::sharing::UIDToUser(uid, name) ? name : std::to_string(uid);
}

std::vector<std::string> UnknownAccounts(const std::vector<std::string> &names) {
  return Unknown(names, VELK::sharing::UserToUID);
}

std::vector<std::string> UnknownGroups(const std::vector<std::string> &names) {
  return Unknown(names, VELK::sharing::GroupToGID);
}

}  // namespace operations
