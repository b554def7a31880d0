#include "server/runtime_folder.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <stdexcept>
#include <system_error>

#include "http/unique_fd.h"
#include "velk_paths.h"

namespace web {
namespace {

constexpr size_t kSecretBytes = 32;

[[noreturn]] void Fail(const std::string &path) {
  throw std::runtime_error(path + ": " + std::generic_category().message(errno));
}

void CheckOwnership(const std::string &folder) {
  struct stat found = {};
  if (stat(folder.c_str(), &found) != 0) Fail(folder);
  if (!S_ISDIR(found.st_mode) || found.st_uid != geteuid() || (found.st_mode & 022) != 0)
    throw std::runtime_error(folder + ": not a folder that this user alone may write to");
}

/// "" where there is no file yet.
std::string ReadSecret(const std::string &path) {
  const UniqueFd file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW));
  if (!file.IsOpen() && errno == ENOENT) return "";
  if (!file.IsOpen()) Fail(path);
  std::string secret(kSecretBytes, '\0');
  if (read(file.get(), secret.data(), secret.size()) != static_cast<ssize_t>(kSecretBytes))
    throw std::runtime_error(path + ": too short; remove it, and a new one is made");
  return secret;
}

/// Puts a new secret in place unless another process was faster. Nobody sees half of one.
void MakeSecret(const std::string &path) {
  std::array<unsigned char, kSecretBytes> bytes = {};
  if (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size()))
    Fail("random numbers");
  const std::string draft = path + "." + std::to_string(getpid());
  unlink(draft.c_str());
  const UniqueFd file(open(draft.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
  if (!file.IsOpen()) Fail(draft);
  const bool is_written =
      write(file.get(), bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size());
  const bool is_there = is_written && (link(draft.c_str(), path.c_str()) == 0 || errno == EEXIST);
  const int error = errno;
  unlink(draft.c_str());
  errno = error;
  if (!is_there) Fail(path);
}

}  // namespace

void MakeRuntimeFolder(const std::string &folder) {
  std::error_code error;
  std::filesystem::create_directories(std::filesystem::path(folder).parent_path(), error);
  if (mkdir(folder.c_str(), 0700) != 0) {
    if (errno != EEXIST) Fail(folder);
    return;
  }
  if (geteuid() == 0 && chown(folder.c_str(), VELK_SYSTEM_UID, VELK_SYSTEM_GID) != 0) Fail(folder);
}

std::string FormSecret(const std::string &folder) {
  CheckOwnership(folder);
  const std::string path = folder + "/form-secret";
  std::string secret = ReadSecret(path);
  if (!secret.empty()) return secret;
  MakeSecret(path);
  return ReadSecret(path);
}

}  // namespace web
