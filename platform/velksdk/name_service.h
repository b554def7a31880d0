#ifndef VELKSDK_NAME_SERVICE_H
#define VELKSDK_NAME_SERVICE_H

#include <sys/types.h>

#include <optional>
#include <string>

namespace velk {

/// An account as the machine's name service knows it.
struct Account {
  std::string name;
  uid_t uid;
  gid_t primary_gid;
};

/// A group as the machine's name service knows it. Members are not kept.
struct Group {
  std::string name;
  gid_t gid;
};

/// Each finds nothing when there is no such record, when the lookup fails, or for a null or empty
/// name. They may throw std::bad_alloc.
std::optional<Account> FindAccount(const char *name);
std::optional<Account> FindAccount(uid_t uid);
std::optional<Group> FindGroup(const char *name);
std::optional<Group> FindGroup(gid_t gid);

}  // namespace velk

#endif
