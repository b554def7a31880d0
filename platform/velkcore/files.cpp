#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>

#include "descriptor.h"
#include "velk/velkcore.h"

namespace {

constexpr unsigned int kPermissionBits = 07777;

int Fail(int error) {
  errno = error;
  return -1;
}

bool IsSymbolicLink(const char *path) {
  struct stat status;
  return lstat(path, &status) == 0 && S_ISLNK(status.st_mode);
}

}  // namespace

int VLIBCFileExist(const char *path) {
  struct stat status;
  return path != nullptr && stat(path, &status) == 0 ? 1 : 0;
}

int VLIBCFileTouch(const char *path) {
  if (path == nullptr) return Fail(EINVAL);
  // For reading, because futimens() asks for ownership or write permission by itself, and a
  // read-only file's owner may touch it. Non-blocking, because a pipe may lie in the way.
  const velkcore::Descriptor file(
      open(path, O_RDONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0600));
  if (!file.IsOpen()) return -1;
  struct stat status;
  if (fstat(file.number(), &status) == -1) return -1;
  if (!S_ISREG(status.st_mode)) return Fail(EINVAL);
  return futimens(file.number(), nullptr);
}

int VELKFSAclChmod(const char *path, int /*reserved*/, unsigned int mode) {
  if (path == nullptr || mode > kPermissionBits) return Fail(EINVAL);
  if (fchmodat(AT_FDCWD, path, mode, AT_SYMLINK_NOFOLLOW) == 0) return 0;
  // A link has no mode of its own; "not supported" would hide what is wrong.
  if (errno == EOPNOTSUPP) errno = IsSymbolicLink(path) ? ELOOP : EOPNOTSUPP;
  return -1;
}
