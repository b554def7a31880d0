#include "share/owner_scope.h"

#include <linux/capability.h>
#include <sys/fsuid.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

namespace web::share {
namespace {

constexpr uid_t kRoot = 0;
// No account has this id: the kernel answers with the current one and changes nothing.
constexpr uid_t kAskUid = static_cast<uid_t>(-1);
constexpr gid_t kAskGid = static_cast<gid_t>(-1);

constexpr uint64_t Bit(int capability) {
  return uint64_t{1} << capability;
}

constexpr uint64_t kSwitching = Bit(CAP_SETUID) | Bit(CAP_SETGID);
constexpr uint64_t kPastPermissions = Bit(CAP_DAC_OVERRIDE) | Bit(CAP_DAC_READ_SEARCH) |
                                      Bit(CAP_FOWNER) | Bit(CAP_CHOWN) | Bit(CAP_MAC_OVERRIDE);
// What the kernel takes away or brings back when a file-system user id changes from or to root's.
constexpr uint64_t kTiedToRoot =
    kPastPermissions | Bit(CAP_MKNOD) | Bit(CAP_FSETID) | Bit(CAP_LINUX_IMMUTABLE);

struct CapabilitySets {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct data[_LINUX_CAPABILITY_U32S_3] = {};
};

bool Get(CapabilitySets &sets) {
  return syscall(SYS_capget, &sets.header, sets.data) == 0;
}

uint64_t Effective(const CapabilitySets &sets) {
  return uint64_t{sets.data[1].effective} << 32 | sets.data[0].effective;
}
uint64_t Permitted(const CapabilitySets &sets) {
  return uint64_t{sets.data[1].permitted} << 32 | sets.data[0].permitted;
}

uint64_t EffectiveCapabilities() {
  CapabilitySets sets;
  return Get(sets) ? Effective(sets) : 0;
}

bool SetEffectiveCapabilities(uint64_t capabilities) {
  CapabilitySets sets;
  if (!Get(sets)) return false;
  sets.data[0].effective = static_cast<uint32_t>(capabilities);
  sets.data[1].effective = static_cast<uint32_t>(capabilities >> 32);
  return syscall(SYS_capset, &sets.header, sets.data) == 0;
}

// The C library's setgroups() changes every thread.
bool SetGroups(const std::vector<gid_t> &groups) {
#ifdef SYS_setgroups32
  constexpr long kCall = SYS_setgroups32;
#else
  constexpr long kCall = SYS_setgroups;
#endif
  return syscall(kCall, groups.size(), groups.data()) == 0;
}

std::vector<gid_t> Groups() {
  constexpr int kUsual = 32;
  gid_t usual[kUsual];
  const int few = getgroups(kUsual, usual);
  if (few >= 0) return {usual, usual + few};
  const int count = getgroups(0, nullptr);
  std::vector<gid_t> groups(count > 0 ? static_cast<size_t>(count) : 0);
  if (!groups.empty() && getgroups(count, groups.data()) != count) groups.clear();
  return groups;
}

uid_t FileUid() {
  return static_cast<uid_t>(setfsuid(kAskUid));
}
gid_t FileGid() {
  return static_cast<gid_t>(setfsgid(kAskGid));
}

// These calls do not say whether they did it.
bool SetFileUid(uid_t uid) {
  setfsuid(uid);
  return FileUid() == uid;
}
bool SetFileGid(gid_t gid) {
  setfsgid(gid);
  return FileGid() == gid;
}

/// Changes what differs. These calls are most of what a small request costs the kernel.
bool ChangeIds(const FileRights &from, const FileRights &to) {
  return (from.groups == to.groups || SetGroups(to.groups)) &&
         (from.gid == to.gid || SetFileGid(to.gid)) && (from.uid == to.uid || SetFileUid(to.uid));
}

/// The kernel asks for the group id before it looks at the groups, so these need not name it. Then
/// most accounts have none, as this process, and there is nothing to change.
std::vector<gid_t> FurtherGroups(const Owner &owner) {
  std::vector<gid_t> groups = owner.groups;
  std::erase(groups, owner.gid);
  return groups;
}

FileRights RightsOf(const Owner &owner, const FileRights &current) {
  return {owner.uid, owner.gid, FurtherGroups(owner), current.capabilities & ~kPastPermissions};
}

}  // namespace

FileRights CurrentFileRights() {
  return {FileUid(), FileGid(), Groups(), EffectiveCapabilities()};
}

bool MaySwitchFileRights() {
  return (EffectiveCapabilities() & kSwitching) == kSwitching;
}

OwnerScope::OwnerScope(const Owner &owner) {
  CapabilitySets sets;
  if (!Get(sets) || (Effective(sets) & kSwitching) != kSwitching) {
    is_entered_ = true;
    return;
  }
  if (owner.uid == kRoot) {
    syslog(LOG_NOTICE, "nothing is opened as root: a link of root is not served");
    return;
  }
  saved_ = {FileUid(), FileGid(), Groups(), Effective(sets)};
  taken_ = RightsOf(owner, saved_);
  changes_capabilities_ = ((Effective(sets) | Permitted(sets)) & kTiedToRoot) != 0;
  prctl(PR_GET_PDEATHSIG, &saved_death_signal_);
  is_switched_ = true;
  is_entered_ = Change(saved_, taken_);
  if (is_entered_) return;
  syslog(LOG_ERR, "cannot take on the file rights of user %u", owner.uid);
  Leave();
  is_switched_ = false;
}

OwnerScope::~OwnerScope() {
  if (!is_switched_) return;
  const int callers_errno = errno;
  Leave();
  errno = callers_errno;
}

// The capabilities come last: a user id that changes from or to root's takes some away or brings
// them back, and a process that is not root keeps what it should not have.
bool OwnerScope::Change(const FileRights &from, const FileRights &to) const {
  return ChangeIds(from, to) &&
         (!changes_capabilities_ || SetEffectiveCapabilities(to.capabilities));
}

// Where entering failed half-way, what differs is what may have changed.
void OwnerScope::Leave() const {
  if (!Change(taken_, saved_)) {
    syslog(LOG_CRIT, "cannot get back from another user's file rights; this process ends");
    abort();
  }
  if (saved_death_signal_ != 0) prctl(PR_SET_PDEATHSIG, saved_death_signal_);
}

}  // namespace web::share
