#include "share/zip_walk.h"

#include <syslog.h>

#include <algorithm>
#include <utility>

#include "share/owner_scope.h"
#include "share/readable.h"
#include "share/zip.h"

namespace web::share {
namespace {

using Parts = std::vector<std::string>;

Parts Below(const Parts &folder, std::string name) {
  Parts parts = folder;
  parts.push_back(std::move(name));
  return parts;
}

void LogLeftOut(const Parts &parts) {
  syslog(LOG_NOTICE, "a ZIP archive goes without “%s”, which cannot be opened",
         Readable(RelativePath(parts)).c_str());
}

}  // namespace

ZipWalk::ZipWalk(SharedTree tree, Parts folder, Parts names, size_t max_entries)
    : tree_(std::move(tree)),
      folder_(std::move(folder)),
      names_(std::move(names)),
      max_entries_(max_entries) {
  std::reverse(names_.begin(), names_.end());
  if (names_.empty()) Descend(folder_);
}

std::optional<Item> ZipWalk::Next() {
  while (std::optional<Parts> parts = NextPlace()) {
    std::optional<Item> item = tree_.Find(*parts);
    if (!item) {
      LogLeftOut(*parts);
      continue;
    }
    if (++visited_ > max_entries_) Fail("it has too many entries");
    if (item->is_folder) Descend(std::move(*parts));
    if (has_failed_) return std::nullopt;
    return item;
  }
  return std::nullopt;
}

std::optional<Parts> ZipWalk::NextPlace() {
  while (!has_failed_ && !levels_.empty()) {
    if (std::optional<Parts> parts = NextInFolder()) return parts;
    levels_.pop_back();
  }
  return has_failed_ ? std::nullopt : NextSelected();
}

std::optional<Parts> ZipWalk::NextSelected() {
  if (names_.empty()) return std::nullopt;
  Parts parts = Below(folder_, std::move(names_.back()));
  names_.pop_back();
  return parts;
}

std::optional<Parts> ZipWalk::NextInFolder() {
  const OwnerScope as_owner(tree_.root().owner);
  Level &level = levels_.back();
  while (as_owner.IsEntered()) {
    std::optional<FolderReader::Found> found = level.reader.Next();
    if (!found) break;
    // A link to a folder could lead up again.
    if (found->is_link && S_ISDIR(found->status.st_mode)) continue;
    return Below(level.parts, std::move(found->name));
  }
  if (!as_owner.IsEntered() || level.reader.HasFailed()) Fail("a folder cannot be read on");
  return std::nullopt;
}

void ZipWalk::Descend(Parts parts) {
  if (levels_.size() == kMaxZipDepth) return Fail("the folder is too deep");
  const OwnerScope as_owner(tree_.root().owner);
  std::optional<FolderReader> reader =
      as_owner.IsEntered() ? FolderReader::Open(tree_.root(), parts) : std::nullopt;
  if (!reader) return LogLeftOut(parts);
  levels_.push_back({std::move(parts), std::move(*reader)});
}

void ZipWalk::Fail(const char *reason) {
  syslog(LOG_WARNING, "a ZIP archive of “%s” is broken off: %s",
         Readable(RelativePath(folder_)).c_str(), reason);
  has_failed_ = true;
}

}  // namespace web::share
