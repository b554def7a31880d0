#ifndef VELKSHARING_WEB_SHARE_OWNER_SCOPE_H
#define VELKSHARING_WEB_SHARE_OWNER_SCOPE_H

#include <sys/types.h>

#include <cstdint>
#include <vector>

#include "share/owner.h"

namespace web::share {

/// What the kernel goes by when a thread opens a file.
struct FileRights {
  uid_t uid = 0;
  gid_t gid = 0;
  std::vector<gid_t> groups;
  uint64_t capabilities = 0;  ///< The effective ones, one bit each.
};

/// Those of the calling thread.
FileRights CurrentFileRights();

/// Whether the calling thread may take on another account's file rights.
bool MaySwitchFileRights();

/// Takes on an account's file rights for a scope: file-system ids, groups, and none of the
/// capabilities that go past permissions. Only the calling thread changes; other threads and the
/// process's other ids do not. The rights that were there come back at the end of the scope, on the
/// same thread; where that fails, the process ends, for it must not go on as somebody else.
///
/// A thread that may not switch keeps its rights. One that may never takes on root's.
///
///     const OwnerScope as_owner(owner);
///     if (!as_owner.IsEntered()) return std::nullopt;
///     open(...)
///
/// The kernel clears PR_SET_PDEATHSIG and the dumpable flag of a process whose ids change; the
/// former is put back.
class OwnerScope {
 public:
  explicit OwnerScope(const Owner &owner);
  OwnerScope(const OwnerScope &) = delete;
  OwnerScope &operator=(const OwnerScope &) = delete;
  ~OwnerScope();

  /// Whether files may be opened for the owner now. If not, nothing has changed; the log has the
  /// reason.
  bool IsEntered() const { return is_entered_; }

 private:
  bool Change(const FileRights &from, const FileRights &to) const;
  void Leave() const;

  FileRights saved_;
  FileRights taken_;
  bool changes_capabilities_ = false;
  int saved_death_signal_ = 0;
  bool is_switched_ = false;
  bool is_entered_ = false;
};

}  // namespace web::share

#endif
