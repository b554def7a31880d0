#ifndef VELKSHARING_WEB_GATE_PATH_READINGS_H
#define VELKSHARING_WEB_GATE_PATH_READINGS_H

#include <cstddef>
#include <optional>
#include <string_view>
#include <vector>

#include "gate/reading.h"

namespace web::gate {

/// A path that could be read in more ways is refused.
constexpr size_t kMostReadings = 64;

/// In how many ways the servers behind the gate may read a path.
///
/// Between the gate and a page stand web servers, frameworks and applications, and each makes
/// something else of an address. Whoever decides by one of their readings lets visitors in through
/// the others. So this gives all of them: the path as it was sent, and whatever any row of these
/// steps makes of it, in any order and as often as they change something.
///
/// - Escapes are decoded. Twice is a row of two such steps.
/// - A slash that came out of an escape separates, as other slashes do. Until then it is a letter.
/// - A backslash separates, also one out of an escape.
/// - Slashes in a row become one. Until then there are empty components between them.
/// - "." and ".." are resolved; ".." stops at the root. Until then they are names.
/// - Parameters go: what follows a ";" in each component.
/// - The path ends before a ";", "?" or "#" that came with it, for somebody takes what follows for
///   parameters, a query or a fragment.
/// - "//host/path" loses its host, for somebody takes it for an address without a scheme.
///
/// A path with none of this has one reading. So has one whose only escapes are those that browsers
/// write, such as "%20" and "%C3%A9". An escape without need ("%70") makes two: there are servers
/// that compare the path as it was sent. Most addresses with another address in them have some ten.
///
/// Not told apart are the ways to write an escape that is needed: "%c3", "%C3" and the bare byte.
/// Not seen are a server's wishes beyond all that: one that ignores case, takes "+" for a blank,
/// normalises Unicode, or drops dots or blanks at the end of a name.
///
/// @param path begins with "/"; without query. A slash at its end makes no difference.
/// @return distinct readings, the one that is closest to what was sent first; nothing for a path
///         that holds a bare blank, a control character or a character of UTF-8 that is longer than
///         it need be, bare or behind escapes, or a broken escape; and for one with more than
///         `kMostReadings`.
std::optional<std::vector<Reading>> ReadingsOf(std::string_view path);

/// The reading of a path that can be read in one way. Escapes without need do not count: they are
/// decoded before anything else, so this is for paths that somebody wrote down, not for requests.
/// @return nothing for a path that can be read in several ways or in none.
std::optional<Reading> OnlyReading(std::string_view path);

}  // namespace web::gate

#endif
