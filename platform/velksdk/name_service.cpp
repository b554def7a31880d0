#include "name_service.h"

#include <grp.h>
#include <pwd.h>

#include <cerrno>
#include <cstring>
#include <vector>

namespace velk {
namespace {

constexpr size_t kFirstBufferSize = 1024;
constexpr size_t kLongestName = 4096;  // modules copy names to the stack, or abort over large ones
constexpr size_t kLargestBufferSize = 64 << 20;  // a group of a million members fits

/// Calls a reentrant lookup with a buffer that grows until the record fits.
/// @param lookup int(Record *record, char *buffer, size_t size, Record **found)
/// @param keep what to make of the record while its texts are valid
template <typename Record, typename Lookup, typename Keep>
auto LookUp(const Lookup &lookup, const Keep &keep) -> std::optional<decltype(keep(Record()))> {
  std::vector<char> buffer(kFirstBufferSize);
  for (;;) {
    Record record{};
    Record *found = nullptr;
    const int outcome = lookup(&record, buffer.data(), buffer.size(), &found);
    const int error = outcome == -1 ? errno : outcome;  // wrapped name services may say it so
    if (error == EINTR) continue;
    if (error == ERANGE && buffer.size() < kLargestBufferSize) {
      buffer.resize(buffer.size() * 2);
      continue;
    }
    if (error != 0 || found == nullptr) return std::nullopt;
    return keep(*found);
  }
}

Account KeepAccount(const passwd &record) {
  return {record.pw_name, record.pw_uid, record.pw_gid};
}

Group KeepGroup(const group &record) {
  return {record.gr_name, record.gr_gid};
}

bool CanBeAName(const char *name) {
  return name != nullptr && *name != '\0' && strnlen(name, kLongestName + 1) <= kLongestName;
}

}  // namespace

std::optional<Account> FindAccount(const char *name) {
  if (!CanBeAName(name)) return std::nullopt;
  return LookUp<passwd>(
      [name](passwd *record, char *buffer, size_t size, passwd **found) {
        return getpwnam_r(name, record, buffer, size, found);
      },
      KeepAccount);
}

std::optional<Account> FindAccount(uid_t uid) {
  return LookUp<passwd>(
      [uid](passwd *record, char *buffer, size_t size, passwd **found) {
        return getpwuid_r(uid, record, buffer, size, found);
      },
      KeepAccount);
}

std::optional<Group> FindGroup(const char *name) {
  if (!CanBeAName(name)) return std::nullopt;
  return LookUp<group>(
      [name](group *record, char *buffer, size_t size, group **found) {
        return getgrnam_r(name, record, buffer, size, found);
      },
      KeepGroup);
}

std::optional<Group> FindGroup(gid_t gid) {
  return LookUp<group>(
      [gid](group *record, char *buffer, size_t size, group **found) {
        return getgrgid_r(gid, record, buffer, size, found);
      },
      KeepGroup);
}

}  // namespace velk
