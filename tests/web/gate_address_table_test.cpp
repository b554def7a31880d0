// The rows of gate_addresses.txt, which says how they are written.

#include <gtest/gtest.h>

#include <cstddef>
#include <fstream>
#include <sstream>
#include <string>

#include "gate/prefix_map.h"

namespace {

using web::gate::Address;
using web::gate::Prefix;
using web::gate::PrefixMap;

constexpr int kFewestRows = 500;

/// What a notation such as "0A" or "3 x /a" means.
std::string Meant(const std::string &notation) {
  const size_t times = notation.find(" x ");
  if (times == std::string::npos)
    return std::string(1, static_cast<char>(std::stoi(notation, nullptr, 16)));
  std::string repeated;
  for (int count = std::stoi(notation); count > 0; --count) repeated += notation.substr(times + 3);
  return repeated;
}

std::string WithNotationsMeant(const std::string &written) {
  std::string text;
  size_t at = 0;
  for (;;) {
    const size_t begin = written.find('<', at);
    text += written.substr(at, begin - at);
    if (begin == std::string::npos) return text;
    const size_t end = written.find('>', begin);
    text += Meant(written.substr(begin + 1, end - begin - 1));
    at = end + 1;
  }
}

/// The keys, or why there are none, as the table writes it.
std::string Outcome(const PrefixMap &guards, const std::string &written) {
  const auto address = Address::Parse(WithNotationsMeant(written));
  if (!address) return "refused";
  std::string keys;
  for (const std::string &key : guards.Find(*address)) keys += (keys.empty() ? "" : " ") + key;
  return keys.empty() ? "none" : keys;
}

void AddGuard(const std::string &line, PrefixMap &guards) {
  std::istringstream words(line);
  std::string guard, key, prefix;
  words >> guard >> key >> prefix;
  const auto parsed = Prefix::Parse(prefix);
  ASSERT_TRUE(parsed) << line;
  guards.Add(*parsed, key);
}

TEST(GateAddressTable, EveryAddressHasTheGuardsThatItShouldHave) {
  std::ifstream table(GATE_ADDRESSES);
  ASSERT_TRUE(table) << GATE_ADDRESSES;
  PrefixMap guards;
  int rows = 0;
  int number = 0;
  for (std::string line; std::getline(table, line);) {
    ++number;
    if (line.empty() || line.starts_with("#")) continue;
    if (line.starts_with("guards ")) {
      guards = PrefixMap();
      continue;
    }
    if (line.starts_with("guard ")) {
      AddGuard(line, guards);
      continue;
    }
    const size_t arrow = line.rfind(" -> ");
    ASSERT_NE(std::string::npos, arrow) << "line " << number << ": " << line;
    EXPECT_EQ(line.substr(arrow + 4), Outcome(guards, line.substr(0, arrow)))
        << "line " << number << ": " << line;
    ++rows;
  }
  EXPECT_GE(rows, kFewestRows);
}

}  // namespace
