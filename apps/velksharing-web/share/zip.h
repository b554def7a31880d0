#ifndef VELKSHARING_WEB_SHARE_ZIP_H
#define VELKSHARING_WEB_SHARE_ZIP_H

#include <optional>
#include <string>
#include <vector>

#include "http/response.h"
#include "share/item.h"
#include "share/shared_tree.h"

namespace web::share {

/// Answers GET or HEAD for a folder as a ZIP archive, which is made while it is sent: no temporary
/// file, no known length. Nothing in it tells who owns the files.
///
/// In the archive is what a listing shows, without its limit of entries; symbolic links to folders
/// are only followed where `names` names them. What cannot be read meanwhile is left out and noted
/// in the log. A file that grows meanwhile is cut at the size that it had, one that shrinks breaks
/// the archive off: then the connection is cut, and the visitor knows.
/// @param folder from `tree`.
/// @param names what to take out of the folder; none for everything. One file or folder each.
/// @return nothing when `folder` is a file or one of `names` is not there.
std::optional<Response> MakeZip(const SharedTree &tree, const Item &folder,
                                const std::vector<std::string> &names);

}  // namespace web::share

#endif
