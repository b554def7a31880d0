#include "autoblock_limits.h"

#include <syslog.h>

#include <string_view>

#include "common/config_file.h"
#include "velk_paths.h"

namespace velk {
namespace {

constexpr char kPath[] = VELK_ROOT "/etc/autoblock.conf";

/// What one key may hold and where it goes.
struct Limit {
  std::string_view key;
  long AutoBlockLimits::*value;
  long lowest;
  long highest;
};

constexpr Limit kLimits[] = {
    {"attempts", &AutoBlockLimits::attempts, 1, 1000000},
    {"within", &AutoBlockLimits::within, 1, 31536000},
    {"block", &AutoBlockLimits::block, 0, 315360000},
};

const Limit &FindLimit(std::string_view key) {
  for (const Limit &limit : kLimits) {
    if (limit.key == key) return limit;
  }
  throw ConfigMistake("unknown key");
}

}  // namespace

AutoBlockLimits ReadAutoBlockLimits() {
  AutoBlockLimits limits;
  try {
    ReadConfigFile(kPath, [&](std::string_view key, std::string_view value) {
      const Limit &limit = FindLimit(key);
      limits.*limit.value = ConfigNumber(value, limit.lowest, limit.highest);
    });
    return limits;
  } catch (const ConfigMistake &mistake) {
    syslog(LOG_ERR, "autoblock: %s; using the defaults", mistake.what());
    return {};
  }
}

}  // namespace velk
