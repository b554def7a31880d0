#include "operations/address.h"

#include "common/address.h"
#include "operations/failure.h"
#include "velksdk/autoblock_address.h"

namespace operations {
namespace {

Failure NoAddress(const std::string &text) {
  return Failure(Failure::INVALID, "“" + text + "” is not an IP address");
}

}  // namespace

std::string ParseAddress(const std::string &text) {
  const auto address = velk::ParseAddress(text.c_str());
  if (!address) throw NoAddress(text);
  return velk::PrintAddress(*address);
}

std::string ParseBlockAddress(const std::string &text) {
  const auto key = velk::AutoBlockKey(text.c_str());
  if (!key) throw NoAddress(text);
  return *key;
}

}  // namespace operations
