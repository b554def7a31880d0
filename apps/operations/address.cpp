#include "operations/address.h"

#include <array>

#include "operations/failure.h"
#include "velk/velksdk.h"

namespace operations {
namespace {

using Conversion = int (*)(const char *ip, char *out, size_t capacity);

std::string Convert(const std::string &text, Conversion convert) {
  std::array<char, 64> address{};
  const bool whole = text.find('\0') == std::string::npos;
  if (!whole || convert(text.c_str(), address.data(), address.size()) != 0)
    throw Failure(Failure::INVALID, "“" + text + "” is not an IP address");
  return address.data();
}

}  // namespace

std::string ParseAddress(const std::string &text) {
  return Convert(text, VELKAddressNormalize);
}

std::string ParseBlockAddress(const std::string &text) {
  return Convert(text, VELKAutoBlockAddress);
}

}  // namespace operations
