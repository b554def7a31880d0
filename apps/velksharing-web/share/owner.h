#ifndef VELKSHARING_WEB_SHARE_OWNER_H
#define VELKSHARING_WEB_SHARE_OWNER_H

#include <sys/types.h>

#include <optional>
#include <vector>

namespace web::share {

/// An account, as the kernel has to know it to decide what it may read.
struct Owner {
  uid_t uid = 0;
  gid_t gid = 0;
  std::vector<gid_t> groups;  ///< All of its groups, `gid` among them.
};

/// Asks the name service. An answer is good for five seconds: so long may an account that is gone,
/// or has left a group, still count. Any thread.
/// @return nothing for an id without an account.
std::optional<Owner> FindOwner(uid_t uid);

}  // namespace web::share

#endif
