#include "share/shared_tree.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <syslog.h>

#include <algorithm>
#include <cstring>
#include <utility>

#include "share/owner_scope.h"
#include "share/readable.h"
#include "share/tree_root.h"

namespace web::share {
namespace {

std::string LastPart(const std::string &path) {
  const size_t end = path.find_last_not_of('/');
  if (end == std::string::npos) return "";
  const size_t slash = path.rfind('/', end);
  return path.substr(slash + 1, end - slash);
}

bool IsUsablePath(const std::string &path) {
  return !path.empty() && path.front() == '/' && path.find('\0') == std::string::npos;
}

void LogUnusable(const std::string &path, uid_t owner, const char *reason) {
  syslog(LOG_NOTICE, "cannot serve “%s” of user %u: %s", Readable(path).c_str(), owner, reason);
}

/// The account whose rights apply to a path that a link names.
std::optional<Owner> OwnerOf(const std::string &path, uid_t owner) {
  if (!IsUsablePath(path)) {
    LogUnusable(path, owner, "no absolute path");
    return std::nullopt;
  }
  std::optional<Owner> account = FindOwner(owner);
  if (!account) LogUnusable(path, owner, "there is no such account");
  return account;
}

// What a link names is open already, if it is a file; folders are opened anew, because reading one
// moves the descriptor on.
UniqueFd Reopen(const TreeRoot &root, const std::vector<std::string> &parts) {
  if (parts.empty() && !root.is_folder) {
    return UniqueFd(fcntl(root.file.get(), F_DUPFD_CLOEXEC, 0));
  }
  return OpenBeneath(root, RelativePath(parts));
}

}  // namespace

SharedTree::SharedTree(std::shared_ptr<const TreeRoot> root) : root_(std::move(root)) {}

std::optional<SharedTree> SharedTree::Open(const std::string &path, uid_t owner) {
  const std::optional<Owner> account = OwnerOf(path, owner);
  if (!account) return std::nullopt;
  const OwnerScope as_owner(*account);
  if (!as_owner.IsEntered()) return std::nullopt;
  return OpenEntered(path, *account);
}

std::optional<SharedTree> SharedTree::Open(const std::string &path, uid_t owner,
                                           const std::vector<std::string> &parts,
                                           std::optional<Item> &item) {
  item.reset();
  const std::optional<Owner> account = OwnerOf(path, owner);
  if (!account) return std::nullopt;
  const OwnerScope as_owner(*account);
  if (!as_owner.IsEntered()) return std::nullopt;
  std::optional<SharedTree> tree = OpenEntered(path, *account);
  if (tree) item = tree->FindEntered(parts);
  return tree;
}

std::optional<SharedTree> SharedTree::OpenEntered(const std::string &path, const Owner &owner) {
  auto root = std::make_shared<TreeRoot>();
  root->owner = owner;
  root->file = OpenAbsolute(path);
  if (!root->file.IsOpen()) {
    LogUnusable(path, owner.uid, strerror(errno));
    return std::nullopt;
  }
  const std::optional<struct stat> status = StatServed(root->file);
  if (!status) {
    LogUnusable(path, owner.uid, "neither a file nor a folder of files");
    return std::nullopt;
  }
  root->device = status->st_dev;
  root->is_folder = S_ISDIR(status->st_mode);
  root->name = LastPart(path);
  return SharedTree(std::move(root));
}

bool SharedTree::IsFolder() const {
  return root_->is_folder;
}

const std::string &SharedTree::name() const {
  return root_->name;
}

std::optional<Item> SharedTree::Find(const std::vector<std::string> &parts) const {
  const OwnerScope as_owner(root_->owner);
  return as_owner.IsEntered() ? FindEntered(parts) : std::nullopt;
}

std::optional<Item> SharedTree::FindEntered(const std::vector<std::string> &parts) const {
  if (!std::all_of(parts.begin(), parts.end(), IsVisibleName)) return std::nullopt;
  UniqueFd file = Reopen(*root_, parts);
  if (!file.IsOpen()) return std::nullopt;
  const std::optional<struct stat> status = StatServed(file, root_->device);
  if (!status) return std::nullopt;
  Item item;
  item.parts = parts;
  item.name = parts.empty() ? root_->name : parts.back();
  item.is_folder = S_ISDIR(status->st_mode);
  item.size = item.is_folder ? 0 : status->st_size;
  item.changed = status->st_mtim;
  item.inode = status->st_ino;
  item.file = std::move(file);
  return item;
}

}  // namespace web::share
