#include "http/path.h"

#include "http/percent.h"

namespace web {
namespace {

/// Whether a decoded component can only be the name of something in its folder.
bool IsName(std::string_view component) {
  return !component.empty() && component != "." && component != ".." &&
         component.find_first_of(std::string_view("/\0", 2)) == std::string_view::npos;
}

}  // namespace

std::optional<PathParts> SplitPath(std::string_view encoded) {
  PathParts parts;
  if (encoded.empty()) return parts;
  if (encoded.front() != '/') return std::nullopt;
  parts.ends_with_slash = encoded.back() == '/';
  encoded.remove_prefix(1);
  if (encoded.empty()) return parts;
  if (parts.ends_with_slash) encoded.remove_suffix(1);
  for (;;) {
    const size_t slash = encoded.find('/');
    std::optional<std::string> component = PercentDecode(encoded.substr(0, slash));
    if (!component || !IsName(*component)) return std::nullopt;
    parts.components.push_back(std::move(*component));
    if (slash == std::string_view::npos) return parts;
    encoded.remove_prefix(slash + 1);
  }
}

std::string JoinPath(const std::vector<std::string> &components) {
  std::string path;
  for (const std::string &component : components) path += "/" + PercentEncode(component);
  return path;
}

}  // namespace web
