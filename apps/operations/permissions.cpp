#include "operations/permissions.h"

#include <json/reader.h>
#include <json/value.h>

#include <algorithm>
#include <memory>
#include <set>

#include "velk/velksdk.h"
#include "velksharing/constants.h"
#include "velksharing/utils.h"

namespace operations {
namespace {

using namespace VELK::sharing;

using Account = std::unique_ptr<VELKUSER, void (*)(VELKUSER *)>;

Account FindAccount(unsigned int uid) {
  VELKUSER *user = nullptr;
  if (VELKUserGetByUID(uid, &user) != 0) user = nullptr;
  return Account(user, VELKUserFree);
}

std::vector<unsigned int> Ids(const Json::Value &list) {
  std::vector<unsigned int> ids;
  for (const Json::Value &id : list) ids.push_back(id.asUInt());
  return ids;
}

std::vector<std::string> Names(const Json::Value &list) {
  std::vector<std::string> names;
  for (const Json::Value &name : list) names.push_back(name.asString());
  return names;
}

}  // namespace

Permissions StoredPermissions(const record::Entry &link) {
  Json::Value data;
  const std::string text = link.GetFieldMap()[SZK_DATA];
  Json::CharReaderBuilder builder;
  const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
  if (!reader->parse(text.data(), text.data() + text.size(), &data, nullptr)) return {};
  return {Ids(data[SZK_PROTECT_UIDS]), Ids(data[SZK_PROTECT_GIDS]),
          Names(data[SZK_PROTECT_EXTRA_USERS]), Names(data[SZK_PROTECT_EXTRA_GROUPS])};
}

Permission PermissionOf(const Permissions &permissions, unsigned int uid) {
  const Account account = FindAccount(uid);
  std::set<unsigned int> groups;
  if (!account || !UserGroupsGet(account.get(), groups)) return NO_SUCH_ACCOUNT;
  if (std::count(permissions.uids.begin(), permissions.uids.end(), uid) != 0) return PERMITTED;
  const bool through_group = std::any_of(permissions.gids.begin(), permissions.gids.end(),
                                         [&](unsigned int gid) { return groups.count(gid) != 0; });
  return through_group ? PERMITTED : NOT_PERMITTED;
}

}  // namespace operations
