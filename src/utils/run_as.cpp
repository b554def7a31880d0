#include "internal/run_as.h"

#include <cerrno>

#include "velk_paths.h"

namespace VELK::sharing::internal {
namespace {

constexpr char kGuardName[] = "IF_RUN_AS";
constexpr uid_t kRoot = 0;
constexpr uid_t kKeepUid = static_cast<uid_t>(-1);
constexpr gid_t kKeepGid = static_cast<gid_t>(-1);

bool SetEffectiveUid(uid_t uid) {
  return setresuid(kKeepUid, uid, kKeepUid) == 0;
}
bool SetEffectiveGid(gid_t gid) {
  return setresgid(kKeepGid, gid, kKeepGid) == 0;
}
bool RegainRoot(uid_t current_uid) {
  return current_uid == kRoot || SetEffectiveUid(kRoot);
}

bool Switch(uid_t uid, gid_t gid) {
  const uid_t current_uid = geteuid();
  const gid_t current_gid = getegid();
  if (current_uid == uid) return current_gid == gid || SetEffectiveGid(gid);
  // Only root may take on other ids, and the group has to change while it still may.
  return RegainRoot(current_uid) && (current_gid == gid || SetEffectiveGid(gid)) &&
         SetEffectiveUid(uid);
}

bool Restore(uid_t saved_uid, gid_t saved_gid) {
  const uid_t current_uid = geteuid();
  const gid_t current_gid = getegid();
  const bool uid_is_back = current_uid == saved_uid;
  const bool gid_is_back = current_gid == saved_gid || saved_gid == kKeepGid;
  if (uid_is_back && gid_is_back) return true;
  if (!uid_is_back && !RegainRoot(current_uid)) return false;
  if (saved_uid == kKeepUid && gid_is_back) return true;
  if ((!gid_is_back || uid_is_back) && !SetEffectiveGid(saved_gid)) return false;
  return uid_is_back || SetEffectiveUid(saved_uid);
}

}  // namespace

const uid_t kSystemUid = VELK_SYSTEM_UID;
const gid_t kSystemGid = VELK_SYSTEM_GID;

RunAsGuard::RunAsGuard(uid_t uid, gid_t gid, Origin origin)
    : saved_uid_(geteuid()), saved_gid_(getegid()), origin_(origin), switched_(Switch(uid, gid)) {
  if (switched_) return;
  syslog(LOG_AUTH | LOG_ERR, "%s:%d ERROR: %s(%d, %d)", origin_.source, origin_.line, kGuardName,
         static_cast<int>(uid), static_cast<int>(gid));
}

RunAsGuard::~RunAsGuard() {
  const int callers_errno = errno;
  if (!Restore(saved_uid_, saved_gid_)) LogRestoreFailure();
  errno = callers_errno;
}

void RunAsGuard::LogRestoreFailure() const {
  syslog(LOG_AUTH | LOG_CRIT, "%s:%d ERROR: ~%s(%d, %d)", origin_.source, origin_.line, kGuardName,
         static_cast<int>(saved_uid_), static_cast<int>(saved_gid_));
}

}  // namespace VELK::sharing::internal
