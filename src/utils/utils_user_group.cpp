#include <array>
#include <cstdio>
#include <cstring>

#include "internal/log.h"
#include "internal/platform_ptr.h"
#include "velk/velkwins.h"
#include "velksharing/utils.h"

namespace VELK::sharing {
namespace {

using internal::GroupPtr;
using internal::LogErrorWithoutPid;
using internal::TextListPtr;
using internal::UserPtr;

constexpr char kSource[] = "utils_user_group";

/// Holds an account name of up to 492 bytes; a longer one is cut.
using NameBuffer = std::array<char, 493>;

void CopyName(NameBuffer &to, const char *from) {
  std::snprintf(to.data(), to.size(), "%s", from);
}

/// Such a name is nobody's; the platform would see the part before it, which may be somebody's.
bool HoldsZeroByte(const std::string &name) {
  return name.find('\0') != std::string::npos;
}

/// Looks an account up and takes hold of it.
/// @return what the platform answered.
int FindUser(const char *name, UserPtr &user) {
  VELKUSER *found = nullptr;
  const int answer = VELKUserGet(name, &found);
  user.reset(found);
  return answer;
}

void RealNameOfDomainAccount(const NameBuffer &login, NameBuffer &real) {
  NameBuffer short_form{};
  if (VELKWinsUserNameFqdn2Netbios(login.data(), short_form.data(), short_form.size()) <= 0) {
    short_form = login;
  }
  VLIBUserRealNameGet(short_form.data(), real.data(), real.size());
}

void RealNameOfLocalAccount(const NameBuffer &login, NameBuffer &real) {
  if (VLIBUserRealNameGet(login.data(), real.data(), real.size()) >= 0) return;
  UserPtr user;
  const bool found = FindUser(login.data(), user) >= 0 && user != nullptr;
  CopyName(real, found ? user->name : login.data());
}

}  // namespace

std::string GetRealUsername(const char *name) {
  if (name == nullptr) return "";
  NameBuffer login{};
  NameBuffer real{};
  if (VELKUserLoginNameConvert(name, login.data(), login.size()) <= 0) CopyName(login, name);
  if (std::strchr(login.data(), '\\') != nullptr) {
    RealNameOfDomainAccount(login, real);
  } else {
    RealNameOfLocalAccount(login, real);
  }
  return real.data();
}

bool UserGet(const char *name, VELKUSER *&user) {
  const std::string real_name = GetRealUsername(name);
  if (VELKUserGet(real_name.c_str(), &user) != -1) return true;
  LogErrorWithoutPid(kSource, "%s:%d No such user [%s]", real_name.c_str());
  return false;
}

bool UserToUID(const std::string &name, unsigned int &uid) {
  if (HoldsZeroByte(name)) return false;
  UserPtr user;
  if (FindUser(GetRealUsername(name.c_str()).c_str(), user) != 0) return false;
  uid = user->uid;
  return true;
}

bool UIDToUser(const unsigned int &uid, std::string &name) {
  VELKUSER *found = nullptr;
  const int answer = VELKUserGetByUID(uid, &found);
  const UserPtr user(found);
  if (answer != 0) return false;
  name = user->name;
  return true;
}

bool GroupToGID(const std::string &name, unsigned int &gid) {
  return !HoldsZeroByte(name) && VELKGroupGetGID(name.c_str(), &gid) == 0;
}

bool GIDToGroup(const unsigned int &gid, std::string &name) {
  VELKGROUP *found = nullptr;
  const int answer = VELKGroupGetByGID(gid, &found);
  const GroupPtr group(found);
  if (answer != 0) return false;
  name = group->name;
  return true;
}

bool UserGroupsGet(VELKUSER *user, std::set<unsigned int> &gids) {
  if (user == nullptr) return false;
  const TextListPtr names(VLIBGroupInfoHashGet(user->name, 1, 0));
  if (names == nullptr) return false;
  int end = 0;
  for (size_t i = 0;; ++i) {
    const char *name = VLIBCSzHashName(names.get(), i, &end);
    if (end != 0) return true;
    unsigned int gid = 0;
    if (name != nullptr && VELKGroupGetGID(name, &gid) == 0) gids.insert(gid);
  }
}

}  // namespace VELK::sharing
