#ifndef VELKSHARING_WEB_SHARE_LISTING_H
#define VELKSHARING_WEB_SHARE_LISTING_H

#include <sys/types.h>

#include <ctime>
#include <optional>
#include <string>
#include <vector>

#include "share/item.h"
#include "share/preview.h"
#include "share/shared_tree.h"

namespace web::share {

/// How many entries of a folder are shown at most.
constexpr size_t kMaxListed = 10'000;

enum class SortBy { NAME, SIZE, DATE };

struct Order {
  SortBy by = SortBy::NAME;
  bool is_descending = false;
};

/// One entry of a folder. For a symbolic link that stays in the tree, what it leads to.
struct Entry {
  std::string name;  ///< In raw bytes, which need not be UTF-8.
  bool is_folder = false;
  off_t size = 0;                            ///< In bytes; 0 for a folder.
  time_t changed = 0;                        ///< When its content changed last.
  PreviewKind preview = PreviewKind::OTHER;  ///< As its name tells; nothing is opened for it.
  bool has_thumbnail = false;                ///< Whether it is worth asking for one.
};

struct Listing {
  std::vector<Entry> entries;  ///< The first kMaxListed by the order.
  size_t left_out = 0;         ///< How many more there are.
};

/// Reads a folder: folders first, then files, each by `order`. Names are compared without regard to
/// case and numbers in them by value ("page 9" before "page 10"); equal sizes and dates go by name.
/// Left out is what SharedTree does not give; a file that the owner cannot read is listed.
/// @param folder from `tree`; a file gives nothing.
/// @return nothing when the folder cannot be read.
std::optional<Listing> ReadListing(const SharedTree &tree, const Item &folder, Order order);

}  // namespace web::share

#endif
