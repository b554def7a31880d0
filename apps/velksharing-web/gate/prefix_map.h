#ifndef VELKSHARING_WEB_GATE_PREFIX_MAP_H
#define VELKSHARING_WEB_GATE_PREFIX_MAP_H

#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "gate/address.h"
#include "gate/prefix.h"

namespace web::gate {

/// Which keys guard which addresses. A key is a text of the caller's, such as the hash of a link.
///
///     PrefixMap guards;
///     guards.Add(*Prefix::Parse("/photos/"), "Ab3x");
///     for (const std::string &hash : guards.Find(address)) ...
///
/// The time of a search depends on the address and on the longest prefix, not on how many prefixes
/// there are. Several threads may search at once while none adds.
class PrefixMap {
 public:
  /// Adding the same twice makes no difference.
  void Add(const Prefix &prefix, std::string_view key);

  /// The keys of the longest prefix that covers the address, in ascending order. A prefix of one
  /// site is longer than any of every site; else the one of more components is longer.
  /// @return what stays valid until the next Add(); empty when no prefix covers the address, and
  ///         when that depends on how it is read: the readings must lead to the same keys.
  const std::vector<std::string> &Find(const Address &address) const;

 private:
  const std::vector<std::string> &KeysOf(const std::string &origin, const Reading &reading) const;
  /// The keys of the longest prefix with this origin, or without any for ""; null without one.
  const std::vector<std::string> *KeysOnSite(const std::string &origin,
                                             std::string_view path) const;

  /// By origin and path, as texts without anything between them.
  std::unordered_map<std::string, std::vector<std::string>> keys_;
  size_t longest_ = 0;  ///< Bytes of the longest path.
};

}  // namespace web::gate

#endif
