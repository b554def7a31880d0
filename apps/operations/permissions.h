#ifndef OPERATIONS_PERMISSIONS_H
#define OPERATIONS_PERMISSIONS_H

#include <string>
#include <vector>

#include "velksharing/record.h"

namespace operations {

/// Whom a link permits, exactly as it is stored. At a login only the ids count; the record's own
/// getters try the names again and would tell more than a visitor gets.
struct Permissions {
  std::vector<unsigned int> uids;
  std::vector<unsigned int> gids;
  std::vector<std::string> unknown_users;   ///< Names that had no id when they were set.
  std::vector<std::string> unknown_groups;  ///< As above.
};

Permissions StoredPermissions(const VELK::sharing::record::Entry &link);

/// How an account stands to a link.
enum Permission {
  PERMITTED,        ///< Itself or through a group.
  NOT_PERMITTED,    ///< Neither.
  NO_SUCH_ACCOUNT,  ///< The user id is unknown, or its groups are not to be had.
};

Permission PermissionOf(const Permissions &permissions, unsigned int uid);

}  // namespace operations

#endif
