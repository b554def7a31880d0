#include "common/address.h"

#include <arpa/inet.h>

#include <cstring>

namespace velk {
namespace {

constexpr size_t kMappedPrefixLength = 12;  // bytes of "::ffff:0:0/96"

std::optional<Address> ParseV4(const char *text) {
  Address address;
  if (inet_pton(AF_INET, text, &address.v4) != 1) return std::nullopt;
  address.family = AF_INET;
  return address;
}

std::optional<Address> ParseV6(const char *text) {
  const size_t length = strcspn(text, "%");
  char bare[INET6_ADDRSTRLEN];
  if (length >= sizeof(bare)) return std::nullopt;
  memcpy(bare, text, length);
  bare[length] = '\0';

  Address address;
  if (inet_pton(AF_INET6, bare, &address.v6) != 1) return std::nullopt;
  address.family = AF_INET6;
  return address;
}

Address UnmapV4(const Address &mapped) {
  Address address;
  address.family = AF_INET;
  memcpy(&address.v4, mapped.v6.s6_addr + kMappedPrefixLength, sizeof(address.v4));
  return address;
}

}  // namespace

std::optional<Address> ParseAddress(const char *text) {
  if (text == nullptr) return std::nullopt;
  if (const auto v4 = ParseV4(text)) return v4;
  const auto v6 = ParseV6(text);
  if (v6 && IN6_IS_ADDR_V4MAPPED(&v6->v6)) return UnmapV4(*v6);
  return v6;
}

std::string PrintAddress(const Address &address) {
  const void *bytes = address.family == AF_INET ? static_cast<const void *>(&address.v4)
                                                : static_cast<const void *>(&address.v6);
  char text[INET6_ADDRSTRLEN] = "";
  inet_ntop(address.family, bytes, text, sizeof(text));
  return text;
}

}  // namespace velk
