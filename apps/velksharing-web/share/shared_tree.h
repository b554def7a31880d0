#ifndef VELKSHARING_WEB_SHARE_SHARED_TREE_H
#define VELKSHARING_WEB_SHARE_SHARED_TREE_H

#include <sys/types.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "share/item.h"
#include "share/owner.h"

namespace web::share {

struct TreeRoot;

/// What a link shares: a file, or a folder with all that is in it, seen as the link's owner sees
/// it. Every open happens with the owner's file-system ids and groups where this thread may switch
/// them (CAP_SETUID and CAP_SETGID), and with the process's own where it may not.
///
/// Not there, for a visitor, is also: what the owner cannot read, what is neither file nor folder
/// (pipes, devices, sockets), what a symbolic link leads to outside of the folder, whatever lies on
/// procfs, and every name with a dot in front. Links that stay inside are followed.
///
/// Copies share one descriptor. Any thread may use a tree that no thread changes.
///
///     if (auto tree = share::SharedTree::Open(path_of_link, owner_of_link)) {
///       if (auto item = tree->Find({"holiday", "beach.jpg"})) ...
///     }
class SharedTree {
 public:
  /// @param path absolute, as the link's `app.path` names it; symbolic links are followed.
  /// @param owner the link's owner. Root's links are not served by a process that can switch ids:
  ///        its files would be opened as root.
  /// @return nothing when there is nothing for a visitor or the owner is no account any more. The
  ///         log says why when the visitor is not to blame.
  static std::optional<SharedTree> Open(const std::string &path, uid_t owner);

  /// Opens the tree and, with the same switch of rights, something in it.
  /// @param[out] item as Find() gives it.
  static std::optional<SharedTree> Open(const std::string &path, uid_t owner,
                                        const std::vector<std::string> &parts,
                                        std::optional<Item> &item);

  bool IsFolder() const;
  /// The last part of the path that the link names, in raw bytes; "" for "/".
  const std::string &name() const;

  /// Opens something in the tree.
  /// @param parts names from the top down, decoded, each one part of the path; none for what the
  ///        link names. A part with '/' or NUL in it, an empty one, and one with a dot in front
  ///        find nothing.
  std::optional<Item> Find(const std::vector<std::string> &parts) const;

  const TreeRoot &root() const { return *root_; }

 private:
  // Within the scope of the owner's rights.
  static std::optional<SharedTree> OpenEntered(const std::string &path, const Owner &owner);
  std::optional<Item> FindEntered(const std::vector<std::string> &parts) const;

  explicit SharedTree(std::shared_ptr<const TreeRoot> root);

  std::shared_ptr<const TreeRoot> root_;
};

}  // namespace web::share

#endif
