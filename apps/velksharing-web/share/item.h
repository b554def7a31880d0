#ifndef VELKSHARING_WEB_SHARE_ITEM_H
#define VELKSHARING_WEB_SHARE_ITEM_H

#include <sys/types.h>

#include <ctime>
#include <optional>
#include <string>
#include <vector>

#include "http/unique_fd.h"

namespace web::share {

/// A file or a folder of a tree, open for reading, with what was true of it when it was opened.
struct Item {
  std::vector<std::string> parts;  ///< Where it is in the tree; none for what the link names.
  std::string name;                ///< In raw bytes, which need not be UTF-8.
  bool is_folder = false;
  off_t size = 0;         ///< In bytes; 0 for a folder.
  timespec changed = {};  ///< When its content changed last.
  ino_t inode = 0;
  UniqueFd file;  ///< Not at a known offset: read with pread().
};

/// The first bytes of a file, of those that it had when it was opened.
/// @return at most `limit`, fewer when the file ends before; nothing when it cannot be read.
std::optional<std::string> ReadStart(const Item &file, size_t limit);

}  // namespace web::share

#endif
