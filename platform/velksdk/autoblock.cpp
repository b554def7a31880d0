#include <syslog.h>

#include <algorithm>
#include <climits>
#include <ctime>
#include <exception>
#include <string>
#include <vector>

#include "autoblock_address.h"
#include "autoblock_file.h"
#include "autoblock_limits.h"
#include "autoblock_table.h"
#include "common/no_throw.h"
#include "velk/velksdk.h"

namespace {

using velk::AutoBlockCategory;
using velk::AutoBlockKey;
using velk::AutoBlockLimits;
using velk::AutoBlockRow;
using velk::AutoBlockTable;
using velk::Connection;

/// What `body` returns, or -1 when it throws; the reason is logged.
template <typename Body>
int Logged(const Body &body) noexcept {
  try {
    return body();
  } catch (const std::exception &error) {
    syslog(LOG_ERR, "autoblock: cannot use %s: %s", velk::kAutoBlockPath, error.what());
    return -1;
  }
}

/// The line that fail2ban waits for; see packaging/fail2ban.
void LogBlock(const std::string &address, const std::string &category, long seconds) {
  if (seconds == 0) {
    syslog(LOG_AUTH | LOG_WARNING, "autoblock: blocked %s for ever, category %s", address.c_str(),
           category.c_str());
    return;
  }
  syslog(LOG_AUTH | LOG_WARNING, "autoblock: blocked %s for %ld seconds, category %s",
         address.c_str(), seconds, category.c_str());
}

VELKAutoBlockRecord RecordOf(const AutoBlockRow &row) {
  return {row.address.c_str(),
          row.category.c_str(),
          static_cast<int>(std::min<int64_t>(row.attempts, INT_MAX)),
          static_cast<long>(row.last_failure),
          row.blocked ? 1 : 0,
          static_cast<long>(row.blocked_until)};
}

}  // namespace

int AutoBlockFailLoginSet(const char *ip, const char *category) {
  return Logged([&] {
    const auto address = AutoBlockKey(ip);
    if (!address) return -1;
    const std::string fit_category = AutoBlockCategory(category);
    const AutoBlockLimits limits = velk::ReadAutoBlockLimits();
    Connection connection = velk::OpenOrMakeAutoBlockFile();
    AutoBlockTable table(connection, time(nullptr));
    if (table.CountFailure(*address, fit_category, limits)) {
      LogBlock(*address, fit_category, limits.block);
    }
    return 0;
  });
}

int VELKAutoBlockResetByIP(const char *ip) {
  return Logged([&] {
    const auto address = AutoBlockKey(ip);
    if (!address) return -1;
    auto connection = velk::OpenAutoBlockFile();
    if (connection) AutoBlockTable(*connection, time(nullptr)).Forget(*address);
    return 0;
  });
}

int VELKAutoBlockIsDenied(const char *ip) {
  return Logged([&] {
    const auto address = AutoBlockKey(ip);
    if (!address) return -1;
    auto connection = velk::OpenAutoBlockFile();
    if (!connection) return 0;
    return AutoBlockTable(*connection, time(nullptr)).IsBlocked(*address) ? 1 : 0;
  });
}

int VELKAutoBlockAdd(const char *ip, const char *category, long seconds) {
  return Logged([&] {
    const auto address = AutoBlockKey(ip);
    const int64_t now = time(nullptr);
    if (!address || seconds < 0 || seconds > LONG_MAX - now) return -1;
    const std::string fit_category = AutoBlockCategory(category);
    Connection connection = velk::OpenOrMakeAutoBlockFile();
    AutoBlockTable(connection, now).Block(*address, fit_category, seconds == 0 ? 0 : now + seconds);
    LogBlock(*address, fit_category, seconds);
    return 0;
  });
}

int VELKAutoBlockList(int (*visit)(const VELKAutoBlockRecord *record, void *data), void *data) {
  if (visit == nullptr) return -1;
  std::vector<AutoBlockRow> rows;
  const int outcome = Logged([&] {
    auto connection = velk::OpenAutoBlockFile();
    if (connection) rows = AutoBlockTable(*connection, time(nullptr)).Rows();
    return 0;
  });
  // The file is closed by now: a visitor may take its time, and may change it.
  return velk::NoThrow(-1, [&] {
    for (const AutoBlockRow &row : rows) {
      const VELKAutoBlockRecord record = RecordOf(row);
      if (visit(&record, data) != 0) break;
    }
    return outcome;
  });
}
