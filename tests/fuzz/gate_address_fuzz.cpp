// Any bytes as an address, and as a prefix: what is accepted keeps to what the headers promise.

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "gate/local_target.h"
#include "gate/path_readings.h"
#include "gate/prefix_map.h"

namespace {

using web::gate::Address;
using web::gate::Prefix;
using web::gate::PrefixMap;
using web::gate::Reading;

void Require(bool condition) {
  if (!condition) std::abort();
}

bool IsPrintable(std::string_view text) {
  return std::ranges::all_of(text, [](char byte) { return byte > ' ' && byte <= '~'; });
}

/// Says for itself which prefix covers a reading.
bool Covers(const Prefix &prefix, const Address &address, const Reading &reading) {
  const std::vector<std::string> outer = prefix.components();
  const std::vector<std::string> inner = reading.components();
  return (prefix.origin().empty() || prefix.origin() == address.origin()) &&
         outer.size() <= inner.size() && std::equal(outer.begin(), outer.end(), inner.begin());
}

void CheckAddress(const Address &address) {
  const std::string &origin = address.origin();
  Require(IsPrintable(origin) && origin.find_first_of("@%\\?#") == std::string::npos);
  Require(origin.starts_with("https://") || origin.starts_with("http://"));
  Require(address.target().starts_with('/'));
  Require(!address.readings().empty() && address.readings().size() <= web::gate::kMostReadings);
  if (address.text().size() > Address::kLongest) return;  // a slash for no path makes it longer
  const std::optional<Address> again = Address::Parse(address.text());
  Require(again && again->text() == address.text() && again->readings() == address.readings());
}

/// The components of every reading make the reading again, and hold nothing that breaks a header.
void CheckReadings(const Address &address) {
  for (const Reading &reading : address.readings()) {
    std::string text;
    for (const std::string &component : reading.components()) {
      for (const char byte : component)
        Require(static_cast<unsigned char>(byte) >= ' ' && byte != '\x7f');
      text += Reading::kSeparator + component;
    }
    Require(text == reading.text());
    Require(reading.LiesBelow(reading) && reading.LiesBelow(Reading("")));
  }
}

void CheckPrefix(const Prefix &prefix) {
  const std::string text = prefix.text();
  if (text.size() > Address::kLongest) return;  // escapes make it longer than it was
  Require(prefix == Prefix::Parse(text) && IsPrintable(text));
  Require(prefix.CookiePath().starts_with('/') &&
          prefix.CookiePath().find(';') == std::string::npos);
  const std::string address = prefix.origin().empty() ? "https://h" + text : text;
  if (address.size() > Address::kLongest) return;
  const std::optional<Address> top = Address::Parse(address);
  Require(top && top->readings().size() == 1 && prefix.Covers(*top));
}

/// One prefix of its own beside the root: the address has the key of the one that all readings lie
/// below, and none when they differ.
void CheckFind(const Prefix &prefix, const Address &address) {
  PrefixMap guards;
  guards.Add(*Prefix::Parse("/"), "root");
  const bool is_root = prefix.text() == "/";
  guards.Add(prefix, "own");
  const auto covered = std::ranges::count_if(
      address.readings(), [&](const Reading &reading) { return Covers(prefix, address, reading); });
  const bool all = static_cast<size_t>(covered) == address.readings().size();
  Require(prefix.Covers(address) == all);
  std::vector<std::string> expected;
  if (is_root) {
    expected = {"own", "root"};
  } else if (all) {
    expected = {"own"};
  } else if (covered == 0) {
    expected = {"root"};
  }
  Require(guards.Find(address) == expected);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  // A line with the prefix may stand before the address.
  const std::string_view input(reinterpret_cast<const char *>(data), size);
  const size_t end = input.find('\n');
  const std::string_view last = end == std::string_view::npos ? input : input.substr(end + 1);
  const std::optional<Address> address = Address::Parse(last);
  const std::optional<Prefix> prefix = Prefix::Parse(input.substr(0, end));
  if (address) {
    CheckAddress(*address);
    CheckReadings(*address);
  }
  if (prefix) CheckPrefix(*prefix);
  if (prefix && address) CheckFind(*prefix, *address);
  if (web::gate::IsLocalTarget(last)) Require(IsPrintable(last) && !last.starts_with("//"));
  return 0;
}
