#ifndef VELKSHARING_WEB_GATE_PREFIX_H
#define VELKSHARING_WEB_GATE_PREFIX_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "gate/address.h"
#include "gate/reading.h"

namespace web::gate {

/// What a link guards: all addresses that begin alike.
///
///     Prefix::Parse("https://wiki.example/");  // one site
///     Prefix::Parse("/photos/");               // a path of every site
///
/// "/photos" and "/photos/" are the same: "/photos" and all below it, not "/photosets". Case counts
/// in the path. A value, immutable.
///
/// A path of every site covers whatever host a request names. Where the web server answers for
/// hosts that it does not know, visitors choose what they name.
class Prefix {
 public:
  /// @return nothing for what is no prefix: a query or fragment, an address that Address::Parse()
  ///         refuses, a path that does not begin with one slash, and a path that servers may read
  ///         in several ways (see OnlyReading()).
  static std::optional<Prefix> Parse(std::string_view text);

  /// Whether the address is this prefix or lies below it, however the servers behind read it.
  bool Covers(const Address &address) const;

  /// As an Address has it; "" for a prefix of every site.
  const std::string &origin() const { return origin_; }
  const Reading &path() const { return path_; }
  std::vector<std::string> components() const { return path_.components(); }
  /// The path for the attribute Path of a cookie, as browsers send it in addresses: "/",
  /// "/my%20photos". Never holds a semicolon.
  std::string CookiePath() const { return EncodedPath(components()); }
  /// Origin and path in their one form: "https://wiki.example/", "/photos".
  std::string text() const { return origin_ + CookiePath(); }

  bool operator==(const Prefix &) const = default;

 private:
  Prefix(std::string origin, Reading path);

  std::string origin_;
  Reading path_;
};

/// The longest path that each of the prefixes lies below, as CookiePath() writes it; their origins
/// do not count. "/" when they have nothing in common, and for none.
std::string CommonCookiePath(const std::vector<Prefix> &prefixes);

}  // namespace web::gate

#endif
