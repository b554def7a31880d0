// Any bytes as the path of a request: its components are names in a folder and nothing else, and a
// path that is put together from them is read as the same.

#include <algorithm>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "http/path.h"
#include "http/text.h"
#include "require.h"
#include "site/routes.h"

namespace {

using velk_test::Require;
using web::Route;

void RequireNames(const std::vector<std::string> &components) {
  for (const std::string &name : components) {
    Require(!name.empty() && name != "." && name != "..");
    Require(name.find('/') == std::string::npos && name.find('\0') == std::string::npos);
  }
}

void CheckSplit(std::string_view path) {
  const auto split = web::SplitPath(path);
  if (!split) return;
  RequireNames(split->components);
  Require(split->ends_with_slash == path.ends_with('/'));

  const std::string joined = web::JoinPath(split->components);
  Require(joined.size() <= 3 * path.size());
  const auto again = web::SplitPath(joined);
  Require(again.has_value() && again->components == split->components && !again->ends_with_slash);
  const auto with_slash = web::SplitPath(joined + "/");
  Require(with_slash.has_value() && with_slash->components == split->components &&
          with_slash->ends_with_slash);
}

/// The path that leads to the same link.
std::string PathOf(const std::string &base, const Route &route) {
  std::vector<std::string> components = route.parts;
  components.insert(components.begin(), route.hash);
  return base + web::JoinPath(components) + (route.ends_with_slash ? "/" : "");
}

void CheckRoute(const std::string &base, std::string_view path) {
  const Route route = web::FindRoute(base, path);
  switch (route.kind) {
    case Route::NOWHERE:
      return;
    case Route::HEALTH:
      Require(path == (base.empty() ? "/-health" : base + "-health"));
      return;
    case Route::ASSET:
      Require(path.starts_with(base + "/") && route.parts.size() == 1 && route.hash.empty());
      RequireNames(route.parts);
      return;
    case Route::LINK:
      break;
  }
  Require(path.starts_with(base + "/"));
  Require(!route.hash.empty() && route.hash.size() <= 64 &&
          std::ranges::all_of(route.hash, web::IsLetterOrDigit));
  RequireNames(route.parts);
  const Route again = web::FindRoute(base, PathOf(base, route));
  Require(again.kind == Route::LINK && again.hash == route.hash && again.parts == route.parts &&
          again.ends_with_slash == route.ends_with_slash);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string_view path(reinterpret_cast<const char *>(data), size);
  CheckSplit(path);
  for (const char *base : {"", "/sharing", "/a/b"}) CheckRoute(base, path);
  return 0;
}
