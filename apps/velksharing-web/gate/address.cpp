#include "gate/address.h"

#include <algorithm>
#include <utility>

#include "gate/origin.h"
#include "gate/path_readings.h"

namespace web::gate {
namespace {

/// Also "#": what is asked of a server has no fragment.
bool IsNeverPartOfAnAddress(char byte) {
  return static_cast<unsigned char>(byte) <= ' ' || byte == '\x7f' || byte == '#';
}

}  // namespace

Address::Address(std::string origin, std::string target, std::vector<Reading> readings)
    : origin_(std::move(origin)), target_(std::move(target)), readings_(std::move(readings)) {}

std::optional<Address> Address::Parse(std::string_view text) {
  if (text.size() > kLongest || std::ranges::any_of(text, IsNeverPartOfAnAddress))
    return std::nullopt;
  std::optional<std::string> origin = TakeOrigin(text);
  if (!origin) return std::nullopt;
  if (text.empty()) text = "/";
  // Not a query: a visitor who names the host "wiki.example?" would turn the path into one.
  if (!text.starts_with('/')) return std::nullopt;
  std::string target(text);
  std::optional<std::vector<Reading>> readings =
      ReadingsOf(std::string_view(target).substr(0, target.find('?')));
  if (!readings) return std::nullopt;
  return Address(*std::move(origin), std::move(target), *std::move(readings));
}

}  // namespace web::gate
