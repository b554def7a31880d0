#include "server/file_offload.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <memory>

#include "http/percent.h"

namespace web {
namespace {

constexpr int kOk = 200;

/// Without symbolic links, as paths of descriptors are; "" for what is not there.
std::string Resolved(const std::string &folder) {
  const std::unique_ptr<char, decltype(&free)> path(realpath(folder.c_str(), nullptr), &free);
  return path == nullptr ? "" : path.get();
}

/// Where an open file lies now; "" when that is not known.
std::string PathOf(int fd) {
  char path[PATH_MAX] = "";
  const std::string link = "/proc/self/fd/" + std::to_string(fd);
  const ssize_t size = readlink(link.c_str(), path, sizeof(path));
  if (size <= 0 || size == static_cast<ssize_t>(sizeof(path)) || path[0] != '/') return "";
  return std::string(path, static_cast<size_t>(size));
}

bool IsWholeFile(const FileBody &body, const struct stat &file) {
  return body.offset == 0 && body.length == file.st_size;
}

/// Whether anybody may get at the file that is open, by this path and without symbolic links.
bool IsReadableForAll(const std::string &path, const struct stat &open_file) {
  struct stat found = {};
  if (lstat(path.c_str(), &found) != 0 || !S_ISREG(found.st_mode)) return false;
  if (found.st_dev != open_file.st_dev || found.st_ino != open_file.st_ino) return false;
  if ((found.st_mode & S_IROTH) == 0) return false;
  for (size_t end = path.rfind('/'); end != 0; end = path.rfind('/', end - 1)) {
    if (lstat(path.substr(0, end).c_str(), &found) != 0) return false;
    if (!S_ISDIR(found.st_mode) || (found.st_mode & S_IXOTH) == 0) return false;
  }
  return true;
}

/// Names that every web server reads alike from a header field.
bool IsPlain(const std::string &path, FileDelivery delivery) {
  return std::all_of(path.begin(), path.end(), [delivery](char byte) {
    const auto value = static_cast<unsigned char>(byte);
    return value >= ' ' && value != 0x7f &&
           (value < 0x80 || delivery == FileDelivery::X_ACCEL_REDIRECT);
  });
}

std::string EncodedPath(const std::string &path) {
  std::string encoded;
  size_t begin = 1;
  while (begin <= path.size()) {
    const size_t end = std::min(path.find('/', begin), path.size());
    encoded += "/" + PercentEncode(path.substr(begin, end - begin));
    begin = end + 1;
  }
  return encoded;
}

}  // namespace

FileOffload::FileOffload(const Settings &settings)
    : delivery_(settings.file_delivery), location_(settings.accel_location) {
  for (const std::string &folder : settings.file_folders) folders_.push_back(Resolved(folder));
}

std::optional<Fields::Field> FileOffload::FieldFor(const Response &response) const {
  const auto *body = std::get_if<FileBody>(&response.body);
  if (delivery_ == FileDelivery::COPY || body == nullptr || response.status != kOk) return {};
  struct stat file = {};
  if (fstat(body->file.get(), &file) != 0 || !IsWholeFile(*body, file)) return {};
  const std::string path = PathOf(body->file.get());
  if (!IsBelowFolders(path) || !IsPlain(path, delivery_)) return {};
  if (!IsReadableForAll(path, file)) return {};
  if (delivery_ == FileDelivery::X_SENDFILE) return Fields::Field("X-Sendfile", EncodedPath(path));
  return Fields::Field("X-Accel-Redirect", location_ + EncodedPath(path));
}

bool FileOffload::IsBelowFolders(const std::string &path) const {
  return std::any_of(folders_.begin(), folders_.end(), [&](const std::string &folder) {
    const bool is_root = folder == "/";
    return !folder.empty() && path.starts_with(is_root ? folder : folder + "/");
  });
}

}  // namespace web
