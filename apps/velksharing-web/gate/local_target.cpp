#include "gate/local_target.h"

#include <algorithm>

#include "http/percent.h"

namespace web::gate {
namespace {

bool IsHarmless(char byte) {
  return byte > ' ' && byte <= '~' && byte != '\\' && byte != '#';
}

}  // namespace

bool IsLocalTarget(std::string_view text) {
  if (text.size() > kLongestLocalTarget) return false;
  if (!text.starts_with('/') || text.starts_with("//")) return false;
  return std::ranges::all_of(text, IsHarmless) && PercentDecode(text).has_value();
}

}  // namespace web::gate
