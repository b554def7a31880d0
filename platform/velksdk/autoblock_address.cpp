#include "autoblock_address.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "common/address.h"

namespace velk {
namespace {

constexpr std::string_view kNetworkMark = "/64";
constexpr size_t kNetworkBytes = 64 / 8;
constexpr size_t kLongestAddress = 128;  // with any sensible zone id
constexpr size_t kLongestCategory = 64;

std::string NetworkOf(Address address) {
  memset(address.v6.s6_addr + kNetworkBytes, 0, sizeof(address.v6) - kNetworkBytes);
  return PrintAddress(address).append(kNetworkMark);
}

bool IsFitForLog(char letter) {
  return (letter >= 'a' && letter <= 'z') || (letter >= 'A' && letter <= 'Z') ||
         (letter >= '0' && letter <= '9') || letter == '-' || letter == '_' || letter == '.';
}

}  // namespace

std::optional<std::string> AutoBlockKey(const char *text) {
  if (text == nullptr || strnlen(text, kLongestAddress + 1) > kLongestAddress) return std::nullopt;
  std::string bare(text);
  const bool is_network = bare.ends_with(kNetworkMark);
  if (is_network) bare.resize(bare.size() - kNetworkMark.size());

  const auto address = ParseAddress(bare.c_str());
  if (!address) return std::nullopt;
  if (address->family == AF_INET6) return NetworkOf(*address);
  if (is_network) return std::nullopt;
  return PrintAddress(*address);
}

std::string AutoBlockCategory(const char *text) {
  const std::string_view category = text == nullptr ? "" : text;
  const bool fit = !category.empty() && category.size() <= kLongestCategory &&
                   std::all_of(category.begin(), category.end(), IsFitForLog);
  return std::string(fit ? category : "unknown");
}

}  // namespace velk
