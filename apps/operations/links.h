#ifndef OPERATIONS_LINKS_H
#define OPERATIONS_LINKS_H

#include <array>
#include <optional>
#include <string>
#include <vector>

#include "operations/database.h"
#include "operations/link_change.h"
#include "operations/link_state.h"
#include "velksharing/record.h"

/// What an administrator does with links. Every function throws Failure: NOT_FOUND for an unknown
/// hash, REFUSED for a link whose row cannot be loaded, DATABASE when a statement failed.

namespace operations {

using VELK::sharing::record::Entry;

/// The link of a hash.
Entry FindLink(BaseDB &db, const std::string &hash);

/// The row id of a link, also of one whose row cannot be loaded.
int FindLinkId(BaseDB &db, const std::string &hash);

/// Makes a link under a fresh hash. `change` must give project and owner; without `app` the link
/// gets an empty one.
Entry CreateLink(BaseDB &db, const LinkChange &change);

/// Changes a link; a use that a visitor makes at the same moment is not lost.
/// @return the link as it is now.
Entry ChangeLink(BaseDB &db, const std::string &hash, const LinkChange &change);

/// Deletes a link and the grants on it. Works for a row that cannot be loaded, too.
/// @return the number of grants that are gone with it.
int DeleteLink(BaseDB &db, const std::string &hash);

/// Columns by which links can be ordered.
enum LinkOrder {
  BY_ID,
  BY_HASH,
  BY_PROJECT,
  BY_OWNER,
  BY_START,
  BY_EXPIRY,
  BY_USES_ALLOWED,
  BY_USE_COUNT
};

constexpr std::array<LinkOrder, 8> kLinkOrders = {
    BY_ID, BY_HASH, BY_PROJECT, BY_OWNER, BY_START, BY_EXPIRY, BY_USES_ALLOWED, BY_USE_COUNT};

/// The name of the column, which is that of the link's JSON form, too.
const char *LinkOrderColumn(LinkOrder order);

/// Which links, in which order.
struct LinkQuery {
  std::optional<std::string> project;
  std::optional<unsigned int> owner_uid;
  std::optional<LinkState> state;
  LinkOrder order = BY_ID;
  bool descending = false;
  Page page;
};

struct LinkList {
  std::vector<Entry> links;  ///< One page.
  int total = 0;             ///< Rows that the filters admit.
  int damaged = 0;           ///< Rows of this page that cannot be loaded and are left out.
};

LinkList ListLinks(BaseDB &db, const LinkQuery &query);

/// Removes the links that are past their expiry or used up, whether or not they are marked for
/// automatic removal.
/// @param owner_uid only this owner's; absent: every owner's.
/// @param project only this application's, not empty; absent: every application's.
Removal PurgeLinks(BaseDB &db, std::optional<unsigned int> owner_uid,
                   const std::optional<std::string> &project);

/// Removes those of them that are marked for automatic removal.
Removal PurgeLinksAutomatically(BaseDB &db);

}  // namespace operations

#endif
