#include "share/tree_root.h"

#include <fcntl.h>
#include <linux/magic.h>
#include <linux/openat2.h>
#include <sys/syscall.h>
#include <sys/vfs.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace web::share {
namespace {

constexpr uint64_t kForReading = O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC | O_LARGEFILE;
constexpr uint64_t kForLooking = O_PATH | O_CLOEXEC;
constexpr uint64_t kConfined = RESOLVE_BENEATH | RESOLVE_NO_MAGICLINKS;
// The kernel gives up on ".." in a link while somebody renames folders; this often is enough.
constexpr int kAttempts = 16;

UniqueFd Open(int folder, const std::string &path, uint64_t flags, uint64_t resolve) {
  open_how how = {};
  how.flags = flags;
  how.resolve = resolve;
  for (int attempt = 0; attempt < kAttempts; ++attempt) {
    UniqueFd file(static_cast<int>(syscall(SYS_openat2, folder, path.c_str(), &how, sizeof how)));
    if (file.IsOpen() || (errno != EAGAIN && errno != EINTR)) return file;
  }
  return UniqueFd();
}

bool IsOnProcfs(const UniqueFd &file) {
  struct statfs file_system = {};
  return fstatfs(file.get(), &file_system) != 0 || file_system.f_type == PROC_SUPER_MAGIC;
}

}  // namespace

bool IsVisibleName(std::string_view name) {
  constexpr std::string_view kSlashAndNul("/\0", 2);
  return !name.empty() && name.front() != '.' &&
         name.find_first_of(kSlashAndNul) == std::string_view::npos;
}

std::string RelativePath(const std::vector<std::string> &parts) {
  if (parts.empty()) return ".";
  std::string path;
  for (const std::string &part : parts) {
    if (!path.empty()) path += '/';
    path += part;
  }
  return path;
}

UniqueFd OpenAbsolute(const std::string &path) {
  return Open(AT_FDCWD, path, kForReading, RESOLVE_NO_MAGICLINKS);
}

UniqueFd OpenBeneath(const TreeRoot &root, const std::string &path) {
  return Open(root.file.get(), path, kForReading, kConfined);
}

std::optional<struct stat> StatBeneath(const TreeRoot &root, const std::string &path) {
  const UniqueFd file = Open(root.file.get(), path, kForLooking, kConfined);
  struct stat status = {};
  if (!file.IsOpen() || fstat(file.get(), &status) != 0) return std::nullopt;
  if (!IsFileOrFolder(status)) return std::nullopt;
  return status;
}

bool IsFileOrFolder(const struct stat &status) {
  return S_ISREG(status.st_mode) || S_ISDIR(status.st_mode);
}

std::optional<struct stat> StatServed(const UniqueFd &file, std::optional<dev_t> served) {
  struct stat status = {};
  if (fstat(file.get(), &status) != 0 || !IsFileOrFolder(status)) return std::nullopt;
  if (status.st_dev != served && IsOnProcfs(file)) return std::nullopt;
  return status;
}

}  // namespace web::share
