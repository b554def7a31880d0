#ifndef VELKSHARING_WEB_GATE_ADDRESS_H
#define VELKSHARING_WEB_GATE_ADDRESS_H

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "gate/reading.h"

namespace web::gate {

/// The absolute address of something that a visitor asks a web server for.
///
///     const std::optional<Address> address = Address::Parse("https://Wiki.example:443/a//b?x");
///     if (!address) return Refused();
///     address->origin();    // "https://wiki.example"
///     address->target();    // "/a//b?x", as it was sent
///     address->readings();  // "a", "", "b" and "a", "b"
///
/// A value, immutable.
class Address {
 public:
  static constexpr size_t kLongest = 16 * 1024;  ///< Bytes.

  /// @return nothing for whatever is no address of http or https, or not clearly one: an account
  ///         before the host, a host or port that is none, a query without a path, a fragment, a
  ///         blank or control character anywhere, a path that ReadingsOf() refuses, more than
  ///         `kLongest` bytes. Bytes beyond ASCII may stand in path and query. The query is not
  ///         looked at any closer.
  static std::optional<Address> Parse(std::string_view text);

  /// Scheme, host and port in their one form: "https://wiki.example", "http://[::1]:8080".
  const std::string &origin() const { return origin_; }
  /// Path and query as they were sent; begins with "/".
  const std::string &target() const { return target_; }
  /// Origin and target: what Parse() makes an equal address of.
  std::string text() const { return origin_ + target_; }
  /// In how many ways the path may be read: one or more. See ReadingsOf().
  const std::vector<Reading> &readings() const { return readings_; }

 private:
  Address(std::string origin, std::string target, std::vector<Reading> readings);

  std::string origin_;
  std::string target_;
  std::vector<Reading> readings_;
};

}  // namespace web::gate

#endif
