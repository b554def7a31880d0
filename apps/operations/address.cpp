#include "operations/address.h"

#include <arpa/inet.h>
#include <netinet/in.h>

#include <cstring>

#include "operations/failure.h"

namespace operations {

std::string ParseAddress(const std::string &text) {
  char printed[INET6_ADDRSTRLEN] = "";
  in_addr v4 = {};
  if (inet_pton(AF_INET, text.c_str(), &v4) == 1)
    return inet_ntop(AF_INET, &v4, printed, sizeof printed);

  in6_addr v6 = {};
  const std::string without_zone = text.substr(0, text.find('%'));
  if (inet_pton(AF_INET6, without_zone.c_str(), &v6) != 1)
    throw Failure(Failure::INVALID, "“" + text + "” is not an IP address");
  if (!IN6_IS_ADDR_V4MAPPED(&v6)) return inet_ntop(AF_INET6, &v6, printed, sizeof printed);
  std::memcpy(&v4, v6.s6_addr + 12, sizeof v4);
  return inet_ntop(AF_INET, &v4, printed, sizeof printed);
}

}  // namespace operations
