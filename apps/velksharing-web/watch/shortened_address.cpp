#include "watch/shortened_address.h"

#include <arpa/inet.h>

#include <algorithm>
#include <iterator>

#include "common/address.h"

namespace web::watch {
namespace {

constexpr uint32_t kNetworkOfV4 = 0xffffff00;  // 24 bits
constexpr int kNetworkBytesOfV6 = 6;           // 48 bits

std::string Network(velk::Address address) {
  if (address.family == AF_INET) {
    address.v4.s_addr &= htonl(kNetworkOfV4);
    return velk::PrintAddress(address) + "/24";
  }
  std::fill(address.v6.s6_addr + kNetworkBytesOfV6, std::end(address.v6.s6_addr), uint8_t{0});
  return velk::PrintAddress(address) + "/48";
}

}  // namespace

std::string ShortenedAddress(const std::string &address, AddressForm form) {
  const auto parsed = velk::ParseAddress(address.c_str());
  if (!parsed || form == AddressForm::NONE) return "";
  return form == AddressForm::FULL ? velk::PrintAddress(*parsed) : Network(*parsed);
}

}  // namespace web::watch
