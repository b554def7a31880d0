#ifndef VELKSHARING_WEB_SHARE_TREE_ROOT_H
#define VELKSHARING_WEB_SHARE_TREE_ROOT_H

#include <sys/stat.h>

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "http/unique_fd.h"
#include "share/owner.h"

namespace web::share {

/// What a link names, open, and whose rights apply below it. Every function here expects to be
/// called within an OwnerScope.
struct TreeRoot {
  Owner owner;
  UniqueFd file;
  dev_t device = 0;
  bool is_folder = false;
  std::string name;
};

/// Whether a visitor may name this in a tree: no dot in front, neither '/' nor NUL in it, not "".
bool IsVisibleName(std::string_view name);

/// "a/b/c", and "." for no parts.
std::string RelativePath(const std::vector<std::string> &parts);

/// Opens what an absolute path names for reading, without ever waiting for it.
UniqueFd OpenAbsolute(const std::string &path);

/// Opens what is at a relative path for reading; no symbolic link leads out of the tree.
UniqueFd OpenBeneath(const TreeRoot &root, const std::string &path);

/// What is at a relative path, or where a symbolic link there leads to inside the tree.
/// @return nothing for what is neither file nor folder.
std::optional<struct stat> StatBeneath(const TreeRoot &root, const std::string &path);

/// Whether visitors may get at what has this kind.
bool IsFileOrFolder(const struct stat &status);

/// Tells what is open.
/// @param served a device of which it is known that visitors may get at its files.
/// @return nothing for what visitors do not get at: what is neither file nor folder, and what tells
///         about the process that reads it rather than about the owner's files.
std::optional<struct stat> StatServed(const UniqueFd &file,
                                      std::optional<dev_t> served = std::nullopt);

}  // namespace web::share

#endif
