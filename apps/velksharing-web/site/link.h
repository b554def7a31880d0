#ifndef VELKSHARING_WEB_SITE_LINK_H
#define VELKSHARING_WEB_SITE_LINK_H

#include <velksharing/record.h>

#include <optional>
#include <string>
#include <vector>

#include "gate/prefix.h"
#include "share/shared_tree.h"
#include "site/find_entry.h"

namespace web {

/// A link that has something for visitors, with what it has.
struct Link {
  EntryPointer entry;  ///< Never null.
  /// Where visitors are sent as soon as they are in; "" for nowhere.
  std::string target;
  /// Where the page offers to go on; "" for nowhere.
  std::string continue_to;
  /// What it guards.
  std::vector<gate::Prefix> prefixes;
  /// Open where there is something to look at: not when `target` is set.
  std::optional<share::SharedTree> tree;
  /// What was asked for in the tree, where it is there.
  std::optional<share::Item> item;

  bool HasUseLimit() const { return entry->get_expire_times() > 0; }
  bool IsOpen() const;
  /// Whether files may be taken along, and not only looked at.
  bool CanDownload() const;
};

/// Opens what a link has for visitors. Whether it is enabled, has started and the like is not
/// looked at.
/// @param parts what is asked for in a folder: names from the top down.
/// @param prefixes what the link guards, which is enough for a visitor, too.
/// @return nothing for a link that has nothing to show: its owner is gone, or cannot read what it
///         shares.
std::optional<Link> OpenLink(EntryPointer entry, const std::vector<std::string> &parts,
                             std::vector<gate::Prefix> prefixes);

/// Whether a link lets new visitors in now.
bool AdmitsVisitors(const VELK::sharing::record::Entry &link);

/// Enough of a hash to find a visitor's requests together, too little to open the link.
std::string ShortenedHash(const std::string &hash);

/// Whether the database answers at all.
bool DatabaseAnswers();

}  // namespace web

#endif
