#include <optional>
#include <string>

#include "autoblock_address.h"
#include "common/address.h"
#include "common/no_throw.h"
#include "common/text.h"
#include "velk/velksdk.h"

namespace {

int Give(const std::optional<std::string> &address, char *out, size_t capacity) {
  return address && velk::CopyText(*address, out, capacity) ? 0 : -1;
}

std::optional<std::string> Normalized(const char *ip) {
  const auto address = velk::ParseAddress(ip);
  if (!address) return std::nullopt;
  return velk::PrintAddress(*address);
}

}  // namespace

int VELKAddressNormalize(const char *ip, char *out, size_t capacity) {
  return velk::NoThrow(-1, [&] { return Give(Normalized(ip), out, capacity); });
}

int VELKAutoBlockAddress(const char *ip, char *out, size_t capacity) {
  return velk::NoThrow(-1, [&] { return Give(velk::AutoBlockKey(ip), out, capacity); });
}
