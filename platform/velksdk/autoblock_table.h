#ifndef VELKSDK_AUTOBLOCK_TABLE_H
#define VELKSDK_AUTOBLOCK_TABLE_H

#include <cstdint>
#include <string>
#include <vector>

#include "autoblock_limits.h"
#include "sqlite.h"

namespace velk {

/// One remembered address. Times are seconds since the Unix epoch.
struct AutoBlockRow {
  std::string address;
  std::string category;
  int64_t attempts;
  int64_t last_failure;
  bool blocked;
  int64_t blocked_until;  ///< 0 = for ever.
};

/// The table of failing addresses. `address` is a text of AutoBlockKey(). Everything throws
/// SqliteError.
class AutoBlockTable {
 public:
  /// Rows that are kept. Beyond, the oldest that are not blocked go first, then the oldest blocked.
  static constexpr int64_t kMostRows = 100000;

  /// @param connection must outlive the table.
  /// @param now the time of this visit to the table.
  AutoBlockTable(Connection &connection, int64_t now) : connection_(connection), now_(now) {}

  /// Counts one failure. While an address is blocked its count stands still; when the block has
  /// lapsed, or the time for counting together, counting starts again.
  /// @return whether this failure blocked the address.
  bool CountFailure(const std::string &address, const std::string &category,
                    const AutoBlockLimits &limits);

  /// Blocks until `until`; 0 = for ever.
  void Block(const std::string &address, const std::string &category, int64_t until);

  void Forget(const std::string &address);

  bool IsBlocked(const std::string &address);

  /// Blocked ones first, then by last failure, newest first.
  std::vector<AutoBlockRow> Rows();

 private:
  void MakeRoomFor(const std::string &newcomer);
  int64_t Drop(const char *sql, const std::string &newcomer, int64_t count);

  Connection &connection_;
  int64_t now_;
};

}  // namespace velk

#endif
