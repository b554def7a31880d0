#ifndef VELKSHARING_WEB_SHARE_FOLDER_READER_H
#define VELKSHARING_WEB_SHARE_FOLDER_READER_H

#include <dirent.h>
#include <sys/stat.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "share/tree_root.h"

namespace web::share {

/// What a folder holds for visitors, one by one, in no order. Used within an OwnerScope; several
/// may follow each other.
class FolderReader {
 public:
  struct Found {
    std::string name;
    struct stat status;    ///< Of what a symbolic link leads to.
    bool is_link = false;  ///< Whether the entry is a symbolic link.
  };

  /// @param parts where the folder is in the tree.
  /// @return nothing when it is no folder or cannot be read.
  static std::optional<FolderReader> Open(const TreeRoot &root,
                                          const std::vector<std::string> &parts);

  /// The next file or folder; nothing at the end.
  std::optional<Found> Next();
  /// Whether reading stopped before the end.
  bool HasFailed() const { return has_failed_; }

 private:
  struct Closer {
    void operator()(DIR *folder) const { closedir(folder); }
  };

  FolderReader(const TreeRoot &root, std::string path, DIR *folder);
  std::optional<Found> Look(const char *name) const;

  const TreeRoot *root_;
  std::string path_;
  std::unique_ptr<DIR, Closer> folder_;
  bool has_failed_ = false;
};

}  // namespace web::share

#endif
