#include "share/listing.h"

#include <algorithm>
#include <utility>

#include "share/folder_reader.h"
#include "share/natural_order.h"
#include "share/owner_scope.h"

namespace web::share {
namespace {

// How many entries are held before those that will not be shown are dropped.
constexpr size_t kMaxHeld = 2 * kMaxListed;

int Compare(off_t left, off_t right) {
  return static_cast<int>(left > right) - static_cast<int>(left < right);
}

int CompareBy(SortBy by, const Entry &left, const Entry &right) {
  if (by == SortBy::SIZE && left.size != right.size) return Compare(left.size, right.size);
  if (by == SortBy::DATE && left.changed != right.changed) {
    return Compare(left.changed, right.changed);
  }
  return CompareNaturally(left.name, right.name);
}

struct ComesBefore {
  Order order;

  bool operator()(const Entry &left, const Entry &right) const {
    if (left.is_folder != right.is_folder) return left.is_folder;
    const int difference = CompareBy(order.by, left, right);
    return order.is_descending ? difference > 0 : difference < 0;
  }
};

Entry EntryOf(FolderReader::Found found) {
  Entry entry;
  entry.is_folder = S_ISDIR(found.status.st_mode);
  entry.size = entry.is_folder ? 0 : found.status.st_size;
  entry.changed = found.status.st_mtim.tv_sec;
  entry.name = std::move(found.name);
  return entry;
}

void DescribePreview(Entry &entry) {
  if (entry.is_folder) return;
  entry.preview = PreviewByName(entry.name);
  entry.has_thumbnail = MayHaveThumbnail(entry.name, entry.size);
}

// Keeps the entries that come first, unsorted.
void DropRest(std::vector<Entry> &entries, ComesBefore comes_before) {
  if (entries.size() <= kMaxListed) return;
  const auto rest = entries.begin() + kMaxListed;
  std::nth_element(entries.begin(), rest, entries.end(), comes_before);
  entries.erase(rest, entries.end());
}

}  // namespace

std::optional<Listing> ReadListing(const SharedTree &tree, const Item &folder, Order order) {
  const OwnerScope as_owner(tree.root().owner);
  if (!as_owner.IsEntered()) return std::nullopt;
  std::optional<FolderReader> reader = FolderReader::Open(tree.root(), folder.parts);
  if (!reader) return std::nullopt;

  const ComesBefore comes_before{order};
  Listing listing;
  size_t total = 0;
  while (std::optional<FolderReader::Found> found = reader->Next()) {
    ++total;
    listing.entries.push_back(EntryOf(std::move(*found)));
    if (listing.entries.size() == kMaxHeld) DropRest(listing.entries, comes_before);
  }
  if (reader->HasFailed()) return std::nullopt;
  DropRest(listing.entries, comes_before);
  std::sort(listing.entries.begin(), listing.entries.end(), comes_before);
  std::for_each(listing.entries.begin(), listing.entries.end(), DescribePreview);
  listing.left_out = total - listing.entries.size();
  return listing;
}

}  // namespace web::share
