#include "gate/prefix.h"

#include <algorithm>
#include <utility>

#include "gate/origin.h"
#include "gate/path_readings.h"

namespace web::gate {

Prefix::Prefix(std::string origin, Reading path)
    : origin_(std::move(origin)), path_(std::move(path)) {}

std::optional<Prefix> Prefix::Parse(std::string_view text) {
  if (text.size() > Address::kLongest || text.find_first_of("?#") != std::string_view::npos)
    return std::nullopt;
  std::string origin;
  if (!text.starts_with('/')) {
    std::optional<std::string> taken = TakeOrigin(text);
    if (!taken) return std::nullopt;
    origin = *std::move(taken);
  }
  std::optional<Reading> path = OnlyReading(text.empty() ? "/" : text);
  if (!path) return std::nullopt;
  return Prefix(std::move(origin), *std::move(path));
}

bool Prefix::Covers(const Address &address) const {
  if (!origin_.empty() && origin_ != address.origin()) return false;
  return std::ranges::all_of(address.readings(),
                             [this](const Reading &reading) { return reading.LiesBelow(path_); });
}

std::string CommonCookiePath(const std::vector<Prefix> &prefixes) {
  if (prefixes.empty()) return "/";
  std::vector<std::string> common = prefixes.front().components();
  for (const Prefix &prefix : prefixes) {
    const auto ends = std::ranges::mismatch(common, prefix.components());
    common.erase(ends.in1, common.end());
  }
  return EncodedPath(common);
}

}  // namespace web::gate
