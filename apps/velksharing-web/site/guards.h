#ifndef VELKSHARING_WEB_SITE_GUARDS_H
#define VELKSHARING_WEB_SITE_GUARDS_H

#include <velksharing/database.h>
#include <velksharing/record.h>

#include <optional>
#include <string>
#include <vector>

#include "gate/address.h"
#include "gate/guarded_prefix.h"
#include "gate/prefix.h"
#include "gate/prefix_map.h"

namespace web {

/// Which links guard which addresses: those that say so themselves (`app.protects`, an array of
/// prefixes), and those that the configuration names. Works on the database of this process.
///
/// At each Refresh() the database is asked whether anybody has written to it since the last one. If
/// so, the links' own word is read again, and parsed where it differs. An index of the database,
/// which is made at the first, holds the links that have one, and nobody pays for the others.
class Guards {
 public:
  explicit Guards(std::vector<gate::GuardedPrefix> configured);

  /// Brings everything up to what the database says now. To be called before each Find().
  /// @return false when the database, or what a link says, cannot be read; nothing is known then.
  bool Refresh();

  /// The hashes of the links that guard an address; see gate::PrefixMap::Find().
  const std::vector<std::string> &Find(const gate::Address &address) const;

  /// All that a link guards, by its own word and by the configuration's. Needs no Refresh().
  std::vector<gate::Prefix> PrefixesOf(const VELK::sharing::record::Entry &link) const;

 private:
  /// A link that says what it guards.
  struct Speaker {
    std::string hash;
    std::string data;  ///< As it is stored.
    std::vector<gate::Prefix> prefixes;
  };

  bool AreKnown(VELK::sharing::db::Result &rows) const;
  bool ReadAnew();
  void Rebuild();

  const std::vector<gate::GuardedPrefix> configured_;
  std::vector<Speaker> speakers_;  ///< By row id.
  /// Of the database, as it was when they were read; nothing while that is not known.
  std::optional<std::string> mark_;
  gate::PrefixMap prefixes_;
};

}  // namespace web

#endif
