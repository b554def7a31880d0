#ifndef VELKSHARING_WEB_SHARE_ZIP_H
#define VELKSHARING_WEB_SHARE_ZIP_H

#include <optional>
#include <string>
#include <vector>

#include "http/response.h"
#include "share/item.h"
#include "share/shared_tree.h"

namespace web::share {

/// How many folders may lie in each other below the one that is packed.
constexpr size_t kMaxZipDepth = 64;
/// How many files and folders an archive may have; each takes memory until the archive ends.
constexpr size_t kMaxZipEntries = 100'000;

/// Answers GET or HEAD for a folder as a ZIP archive, which is made while it is sent: no temporary
/// file, no known length. Nothing in it tells who owns the files.
///
/// In the archive is what a listing shows, without its limit of entries; symbolic links to folders
/// are only followed where `names` names them. What cannot be opened meanwhile is left out and
/// noted in the log; a file that grows or shrinks while it is read is in with what could be read,
/// cut at the size that it had. Where a file fails in the middle, or the folder is too deep
/// (kMaxZipDepth) or has too many entries (kMaxZipEntries), the body ends with an error: nobody
/// takes a part for the whole.
/// @param folder from `tree`.
/// @param names what to take out of the folder; none for everything. One file or folder each.
/// @return nothing when `folder` is a file or one of `names` is not there.
std::optional<Response> MakeZip(const SharedTree &tree, const Item &folder,
                                const std::vector<std::string> &names);

}  // namespace web::share

#endif
