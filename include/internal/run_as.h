#ifndef VELKSHARING_INTERNAL_RUN_AS_H
#define VELKSHARING_INTERNAL_RUN_AS_H

#include <sys/types.h>

#include "internal/log.h"

namespace VELK::sharing::internal {

/// Switches the effective user and group of the process while it lives, and switches back at the
/// end of the scope, whatever the start achieved, and leaves errno as it was then. Failures of
/// either are logged. The ids belong to the whole process: no other thread may depend on them
/// meanwhile.
class RunAsGuard {
 public:
  RunAsGuard(uid_t uid, gid_t gid, Origin origin);
  RunAsGuard(const RunAsGuard &) = delete;
  RunAsGuard &operator=(const RunAsGuard &) = delete;
  ~RunAsGuard();

  /// Whether the process now runs under the ids asked for.
  bool switched() const { return switched_; }

 private:
  void LogRestoreFailure() const;

  const uid_t saved_uid_;
  const gid_t saved_gid_;
  const Origin origin_;
  const bool switched_;
};

/// The ids of the account that owns the database, as the build was told.
extern const uid_t kSystemUid;
extern const gid_t kSystemGid;

}  // namespace VELK::sharing::internal

#endif
