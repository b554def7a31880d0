#include <grp.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "common/no_throw.h"
#include "name_service.h"
#include "velk/velksdk.h"

/// Names in the name service's order; nothing stands for a group id without a name.
struct VLIBCSzHash_tag {
  std::vector<std::optional<std::string>> names;
};

namespace {

using velk::Account;
using velk::FindAccount;
using velk::FindGroup;
using velk::Group;
using velk::NoThrow;

constexpr size_t kMostGroups = 1 << 20;  // far more than a Linux process can hold

/// The caller's own record of a group; null when memory is short.
VELKGROUP *MakeGroup(const Group &group) {
  auto *made = static_cast<VELKGROUP *>(calloc(1, sizeof(VELKGROUP)));
  if (made == nullptr) return nullptr;
  made->gid = group.gid;
  made->name = strdup(group.name.c_str());
  if (made->name == nullptr) {
    free(made);
    return nullptr;
  }
  return made;
}

/// The ids of all groups of an account, the primary one first; empty when that fails.
std::vector<gid_t> GroupIds(const Account &account) {
  std::vector<gid_t> gids(64);
  for (;;) {
    int count = static_cast<int>(gids.size());
    if (getgrouplist(account.name.c_str(), account.primary_gid, gids.data(), &count) >= 0) {
      gids.resize(static_cast<size_t>(count));
      return gids;
    }
    if (gids.size() >= kMostGroups) return {};
    // Not every name service tells how many there are.
    gids.resize(std::max(gids.size() * 2, static_cast<size_t>(std::max(count, 0))));
  }
}

}  // namespace

int VELKGroupGetGID(const char *name, unsigned int *gid) {
  if (gid == nullptr) return -1;
  return NoThrow(-1, [&] {
    const auto group = FindGroup(name);
    if (!group) return -1;
    *gid = group->gid;
    return 0;
  });
}

int VELKGroupGetByGID(unsigned int gid, VELKGROUP **group) {
  if (group == nullptr) return -1;
  *group = nullptr;
  return NoThrow(-1, [&] {
    const auto found = FindGroup(static_cast<gid_t>(gid));
    if (found) *group = MakeGroup(*found);
    return *group != nullptr ? 0 : -1;
  });
}

void VELKGroupFree(VELKGROUP *group) {
  if (group == nullptr) return;
  free(group->name);
  free(group);
}

VLIBCSzHash *VLIBGroupInfoHashGet(const char *user, int, int) {
  return NoThrow(static_cast<VLIBCSzHash *>(nullptr), [&]() -> VLIBCSzHash * {
    const auto account = FindAccount(user);
    if (!account) return nullptr;
    const std::vector<gid_t> gids = GroupIds(*account);
    if (gids.empty()) return nullptr;

    VLIBCSzHash list;
    for (const gid_t gid : gids) {
      const auto group = FindGroup(gid);
      list.names.push_back(group ? std::optional(group->name) : std::nullopt);
    }
    return new VLIBCSzHash(std::move(list));
  });
}

const char *VLIBCSzHashName(const VLIBCSzHash *list, size_t index, int *end) {
  const bool past_end = list == nullptr || index >= list->names.size();
  if (end != nullptr) *end = past_end ? 1 : 0;
  if (past_end || !list->names[index]) return nullptr;
  return list->names[index]->c_str();
}

void VLIBCSzHashFree(VLIBCSzHash *list) {
  delete list;
}
