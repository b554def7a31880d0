#include "server/privileges.h"

#include <grp.h>
#include <linux/capability.h>
#include <linux/securebits.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <system_error>

#include "velk_paths.h"

namespace web {
namespace {

constexpr uid_t kSystemUid = VELK_SYSTEM_UID;
constexpr gid_t kSystemGid = VELK_SYSTEM_GID;

constexpr uint64_t kNeeded = uint64_t{1} << CAP_SETUID | uint64_t{1} << CAP_SETGID;
// A user id of 0 brings no capabilities by itself, programs get none, and nobody changes that.
constexpr unsigned long kSecureBits = SECBIT_NOROOT | SECBIT_NOROOT_LOCKED |
                                      SECBIT_NO_CAP_AMBIENT_RAISE |
                                      SECBIT_NO_CAP_AMBIENT_RAISE_LOCKED;

struct Capabilities {
  uint64_t effective = 0;
  uint64_t permitted = 0;
  uint64_t inheritable = 0;
};

void Require(bool done, const char *step) {
  if (done) return;
  throw std::runtime_error("cannot limit privileges: " + std::string(step) + ": " +
                           std::generic_category().message(errno));
}

// The kernel takes and gives them in halves of 32 bits.
Capabilities OwnCapabilities() {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct half[_LINUX_CAPABILITY_U32S_3] = {};
  Require(syscall(SYS_capget, &header, half) == 0, "reading the capabilities");
  const auto joined = [](uint32_t low, uint32_t high) { return uint64_t{high} << 32 | low; };
  return {joined(half[0].effective, half[1].effective),
          joined(half[0].permitted, half[1].permitted),
          joined(half[0].inheritable, half[1].inheritable)};
}

void SetCapabilities(uint64_t kept) {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct half[_LINUX_CAPABILITY_U32S_3] = {};
  half[0].effective = half[0].permitted = static_cast<uint32_t>(kept);
  half[1].effective = half[1].permitted = static_cast<uint32_t>(kept >> 32);
  Require(syscall(SYS_capset, &header, half) == 0, "setting the capabilities");
}

bool IsNeeded(int capability) {
  return (kNeeded >> capability & 1) != 0;
}

void ShrinkBoundingSet() {
  for (int capability = 0; prctl(PR_CAPBSET_READ, capability, 0, 0, 0) >= 0; ++capability) {
    if (!IsNeeded(capability))
      Require(prctl(PR_CAPBSET_DROP, capability, 0, 0, 0) == 0, "the bounding set");
  }
}

void BecomeSystemAccount() {
  ShrinkBoundingSet();
  Require(prctl(PR_SET_SECUREBITS, kSecureBits | SECBIT_KEEP_CAPS, 0, 0, 0) == 0, "secure bits");
  Require(setgroups(0, nullptr) == 0, "supplementary groups");
  Require(setresgid(kSystemGid, kSystemGid, kSystemGid) == 0, "the group");
  Require(setresuid(kSystemUid, kSystemUid, kSystemUid) == 0, "the user");
  Require(prctl(PR_SET_KEEPCAPS, 0, 0, 0, 0) == 0, "secure bits");
  Require(prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0, "no new privileges");
}

void VerifySystemAccount() {
  uid_t uid[3] = {};
  gid_t gid[3] = {};
  Require(getresuid(&uid[0], &uid[1], &uid[2]) == 0, "reading the user");
  Require(getresgid(&gid[0], &gid[1], &gid[2]) == 0, "reading the group");
  for (const uid_t id : uid) Require(id == kSystemUid, "another user");
  for (const gid_t id : gid) Require(id == kSystemGid, "another group");
  Require(getgroups(0, nullptr) == 0, "supplementary groups are left");
  Require(prctl(PR_GET_NO_NEW_PRIVS, 0, 0, 0, 0) == 1, "no new privileges");
  Require(prctl(PR_GET_SECUREBITS, 0, 0, 0, 0) == static_cast<int>(kSecureBits), "secure bits");
  Require(OwnCapabilities().permitted == kNeeded, "CAP_SETUID and CAP_SETGID are not to be had");
}

void VerifyCapabilities() {
  const Capabilities own = OwnCapabilities();
  Require((own.permitted & ~kNeeded) == 0, "capabilities are left");
  Require(own.effective == own.permitted, "capabilities are not in effect");
  Require(own.inheritable == 0, "inheritable capabilities are left");
}

}  // namespace

void LimitPrivileges() {
  const bool was_root = geteuid() == 0;
  // Systems without ambient capabilities have nothing to clear.
  prctl(PR_CAP_AMBIENT, PR_CAP_AMBIENT_CLEAR_ALL, 0, 0, 0);
  if (was_root) BecomeSystemAccount();
  SetCapabilities(OwnCapabilities().permitted & kNeeded);
  umask(077);
  Require(prctl(PR_SET_DUMPABLE, 0, 0, 0, 0) == 0, "core files");

  if (was_root) VerifySystemAccount();
  VerifyCapabilities();
}

}  // namespace web
