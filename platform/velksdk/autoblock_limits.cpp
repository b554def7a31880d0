#include "autoblock_limits.h"

#include <syslog.h>

#include <cerrno>
#include <charconv>
#include <cstring>
#include <fstream>
#include <set>
#include <stdexcept>
#include <string>
#include <string_view>

#include "common/text.h"

namespace velk {
namespace {

constexpr char kPath[] = VELK_ROOT "/etc/autoblock.conf";
constexpr std::string_view kBlanks = " \t\r";

/// What one key may hold and where it goes.
struct Setting {
  std::string_view key;
  long AutoBlockLimits::*value;
  long lowest;
  long highest;
};

constexpr Setting kSettings[] = {
    {"attempts", &AutoBlockLimits::attempts, 1, 1000000},
    {"within", &AutoBlockLimits::within, 1, 31536000},
    {"block", &AutoBlockLimits::block, 0, 315360000},
};

class Mistake : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

const Setting &FindSetting(std::string_view key) {
  for (const Setting &setting : kSettings) {
    if (setting.key == key) return setting;
  }
  throw Mistake("unknown key");
}

long ReadNumber(std::string_view text, const Setting &setting) {
  long number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error == std::errc::invalid_argument || end != text.data() + text.size()) {
    throw Mistake("not a whole number");
  }
  if (error != std::errc() || number < setting.lowest || number > setting.highest) {
    throw Mistake("not from " + std::to_string(setting.lowest) + " to " +
                  std::to_string(setting.highest));
  }
  return number;
}

void ReadLine(std::string_view line, AutoBlockLimits &limits, std::set<std::string_view> &seen) {
  line = Trim(line.substr(0, line.find('#')), kBlanks);
  if (line.empty()) return;
  const size_t sign = line.find('=');
  if (sign == std::string_view::npos) throw Mistake("not of the form \"key = value\"");
  const Setting &setting = FindSetting(Trim(line.substr(0, sign), kBlanks));
  if (!seen.insert(setting.key).second) throw Mistake("key given twice");
  limits.*setting.value = ReadNumber(Trim(line.substr(sign + 1), kBlanks), setting);
}

}  // namespace

AutoBlockLimits ReadAutoBlockLimits() {
  errno = 0;
  std::ifstream file(kPath);
  if (!file && errno == ENOENT) return {};

  AutoBlockLimits limits;
  std::set<std::string_view> seen;
  std::string line;
  for (int number = 1; std::getline(file, line); ++number) {
    try {
      ReadLine(line, limits, seen);
    } catch (const Mistake &mistake) {
      syslog(LOG_ERR, "autoblock: %s:%d: %s; using the defaults", kPath, number, mistake.what());
      return {};
    }
  }
  if (!file.eof()) {
    syslog(LOG_ERR, "autoblock: cannot read %s: %s; using the defaults", kPath, strerror(errno));
    return {};
  }
  return limits;
}

}  // namespace velk
