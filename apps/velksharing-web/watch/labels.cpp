#include "watch/labels.h"

#include <algorithm>

namespace web::watch {
namespace {

constexpr int kNoStatus = 0;
constexpr int kOtherStatus = -1;

/// Where `item` stands, else the last place.
template <typename Item, size_t count>
size_t PlaceOf(const Item (&items)[count], const Item &item) {
  const auto *found = std::find(std::begin(items), std::end(items), item);
  return found == std::end(items) ? count - 1 : static_cast<size_t>(found - items);
}

std::string_view WithoutPrefix(std::string_view name) {
  for (const std::string_view prefix : {"VELK_SHARING_LOGIN_", "VELK_SHARING_AUTH_"})
    if (name.starts_with(prefix)) return name.substr(prefix.size());
  return name;
}

}  // namespace

size_t RoutePlace(std::string_view route) {
  return PlaceOf(kRouteNames, route);
}

size_t StatusPlace(int status) {
  return PlaceOf(kStatuses, status);
}

size_t ResultPlace(std::string_view name) {
  return name.empty() ? 0 : PlaceOf(kResults, WithoutPrefix(name));
}

size_t BucketPlace(std::chrono::microseconds time) {
  const auto *limit = std::lower_bound(kBucketLimits.begin(), kBucketLimits.end(), time.count());
  return static_cast<size_t>(limit - kBucketLimits.begin());
}

std::string StatusLabel(size_t place) {
  const int status = kStatuses[place];
  if (status == kNoStatus) return "none";
  return status == kOtherStatus ? "other" : std::to_string(status);
}

}  // namespace web::watch
