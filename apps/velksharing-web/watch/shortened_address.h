#ifndef VELKSHARING_WEB_WATCH_SHORTENED_ADDRESS_H
#define VELKSHARING_WEB_WATCH_SHORTENED_ADDRESS_H

#include <string>

namespace web::watch {

/// How much of a visitor's address is kept.
enum class AddressForm {
  FULL,     ///< All of it.
  NETWORK,  ///< The first 24 bits of IPv4, the first 48 of IPv6: "192.0.2.0/24".
  NONE
};

/// An address in that form, as the C library prints it; "" for a text that is none.
std::string ShortenedAddress(const std::string &address, AddressForm form);

}  // namespace web::watch

#endif
