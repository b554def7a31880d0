#include "share/folder_reader.h"

#include <fcntl.h>

#include <cerrno>
#include <utility>

namespace web::share {

FolderReader::FolderReader(const TreeRoot &root, std::string path, DIR *folder)
    : root_(&root), path_(std::move(path)), folder_(folder) {}

std::optional<FolderReader> FolderReader::Open(const TreeRoot &root,
                                               const std::vector<std::string> &parts) {
  std::string path = RelativePath(parts);
  UniqueFd file = OpenBeneath(root, path);
  if (!file.IsOpen() || !StatServed(file, root.device)) return std::nullopt;
  DIR *folder = fdopendir(file.get());
  if (folder == nullptr) return std::nullopt;
  file.Release();
  return FolderReader(root, std::move(path), folder);
}

std::optional<FolderReader::Found> FolderReader::Next() {
  while (true) {
    errno = 0;
    const dirent *entry = readdir(folder_.get());
    if (entry == nullptr) {
      has_failed_ = errno != 0;
      return std::nullopt;
    }
    if (!IsVisibleName(entry->d_name)) continue;
    if (std::optional<Found> found = Look(entry->d_name)) return found;
  }
}

std::optional<FolderReader::Found> FolderReader::Look(const char *name) const {
  Found found = {name, {}, false};
  if (fstatat(dirfd(folder_.get()), name, &found.status, AT_SYMLINK_NOFOLLOW) != 0) {
    return std::nullopt;
  }
  if (S_ISLNK(found.status.st_mode)) {
    const std::optional<struct stat> target = StatBeneath(*root_, path_ + "/" + name);
    if (!target) return std::nullopt;
    found.status = *target;
    found.is_link = true;
  }
  if (!IsFileOrFolder(found.status)) return std::nullopt;
  return found;
}

}  // namespace web::share
