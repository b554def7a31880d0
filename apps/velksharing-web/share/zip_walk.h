#ifndef VELKSHARING_WEB_SHARE_ZIP_WALK_H
#define VELKSHARING_WEB_SHARE_ZIP_WALK_H

#include <optional>
#include <string>
#include <vector>

#include "share/folder_reader.h"
#include "share/item.h"
#include "share/shared_tree.h"

namespace web::share {

/// Goes through a folder, or a selection from it, and all below, one file or folder at a time and
/// each folder before what is in it. What vanishes meanwhile is left out and noted in the log.
class ZipWalk {
 public:
  /// @param folder where it is in the tree.
  /// @param names what to visit there; none for everything.
  /// @param max_entries how many are visited at most.
  ZipWalk(SharedTree tree, std::vector<std::string> folder, std::vector<std::string> names,
          size_t max_entries);

  /// Opens the next one; nothing at the end and after a failure.
  std::optional<Item> Next();
  /// Whether the walk was given up: too deep, too much, or a folder that stopped to be readable.
  bool HasFailed() const { return has_failed_; }

 private:
  struct Level {
    std::vector<std::string> parts;
    FolderReader reader;
  };

  std::optional<std::vector<std::string>> NextPlace();
  std::optional<std::vector<std::string>> NextSelected();
  std::optional<std::vector<std::string>> NextInFolder();
  void Descend(std::vector<std::string> parts);
  void Fail(const char *reason);

  SharedTree tree_;
  std::vector<std::string> folder_;
  std::vector<std::string> names_;  ///< Those to come, the next one last.
  std::vector<Level> levels_;
  size_t max_entries_;
  size_t visited_ = 0;
  bool has_failed_ = false;
};

}  // namespace web::share

#endif
