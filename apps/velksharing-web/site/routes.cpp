#include "site/routes.h"

#include <algorithm>
#include <optional>
#include <utility>

#include "http/path.h"
#include "http/text.h"

namespace web {
namespace {

constexpr size_t kLongestHash = 64;

bool IsHealth(std::string_view below, bool is_at_root) {
  return below == (is_at_root ? "/-health" : "-health");
}

}  // namespace

bool IsHash(std::string_view text) {
  return !text.empty() && text.size() <= kLongestHash && std::ranges::all_of(text, IsLetterOrDigit);
}

bool Route::IsLogout() const {
  return kind == LINK && !ends_with_slash && parts.size() == 1 && parts[0] == "logout";
}

Route FindRoute(std::string_view base_path, std::string_view path) {
  Route route;
  if (!path.starts_with(base_path)) return route;
  path.remove_prefix(base_path.size());
  if (IsHealth(path, base_path.empty())) {
    route.kind = Route::HEALTH;
    return route;
  }
  std::optional<PathParts> split = SplitPath(path);
  if (!split || split->components.empty()) return route;
  std::string first = std::move(split->components.front());
  split->components.erase(split->components.begin());
  if (first == "-" && split->components.size() == 1 && !split->ends_with_slash)
    route.kind = Route::ASSET;
  if (IsHash(first)) {
    route.kind = Route::LINK;
    route.hash = std::move(first);
  }
  route.parts = std::move(split->components);
  route.ends_with_slash = split->ends_with_slash;
  return route;
}

}  // namespace web
