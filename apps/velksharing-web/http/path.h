#ifndef VELKSHARING_WEB_HTTP_PATH_H
#define VELKSHARING_WEB_HTTP_PATH_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace web {

/// The path of an address, below some base, as file names.
struct PathParts {
  std::vector<std::string> components;  ///< Decoded; none is "", "." or ".." or holds "/" or NUL.
  bool ends_with_slash = false;
};

/// Splits a percent-encoded path such as "/a%20b/c/" and decodes each component once, after the
/// split: an encoded slash never separates. The path is "" or begins with a slash; "" and "/" have
/// no components.
/// @return nothing for a path that is not of this form, for a component that is empty, "." or
///         "..", encoded or not, and for one that holds a broken escape, a slash or a zero byte.
std::optional<PathParts> SplitPath(std::string_view encoded);

/// The encoded form of these components, each behind a slash: "/a%20b/c".
std::string JoinPath(const std::vector<std::string> &components);

}  // namespace web

#endif
