#include "autoblock_table.h"

namespace velk {
namespace {

/// Everything is decided inside the statement, under SQLite's write lock: two processes that count
/// at the same moment cannot both read the old number. A blocked row is left alone and returned
/// to nobody, so only the failure that blocks sees `blocked_until` set.
///
/// The distance to the first failure counts in both directions: the clock is read before the wait
/// for the lock, so a failure may be stored after one that is a little younger.
constexpr char kCount[] = R"sql(
  INSERT INTO autoblock AS old
    (address, category, attempts, first_failure, last_failure, blocked_until)
  VALUES (:address, :category, 1, :now, :now, CASE WHEN :limit <= 1 THEN :until END)
  ON CONFLICT (address) DO UPDATE SET
    (category, attempts, first_failure, last_failure, blocked_until) = (
      SELECT excluded.category, fresh.attempts, fresh.first_failure, :now,
             CASE WHEN fresh.attempts >= :limit THEN :until END
      FROM (SELECT iif(together, old.attempts + 1, 1) AS attempts,
                   iif(together, old.first_failure, :now) AS first_failure
            FROM (SELECT old.blocked_until IS NULL
                         AND abs(:now - old.first_failure) < :within AS together)) AS fresh)
  WHERE old.blocked_until IS NULL OR old.blocked_until BETWEEN 1 AND :now
  RETURNING attempts, blocked_until
)sql";

constexpr char kBlock[] = R"sql(
  INSERT INTO autoblock (address, category, attempts, first_failure, last_failure, blocked_until)
  VALUES (:address, :category, 0, :now, :now, :until)
  ON CONFLICT (address) DO UPDATE
    SET category = excluded.category, blocked_until = excluded.blocked_until
)sql";

constexpr char kDropUnblocked[] = R"sql(
  DELETE FROM autoblock WHERE address IN (
    SELECT address FROM autoblock
    WHERE address <> :newcomer AND (blocked_until IS NULL OR blocked_until BETWEEN 1 AND :now)
    ORDER BY last_failure LIMIT :count)
)sql";

constexpr char kDropBlocked[] = R"sql(
  DELETE FROM autoblock WHERE address IN (
    SELECT address FROM autoblock
    WHERE address <> :newcomer AND (blocked_until = 0 OR blocked_until > :now)
    ORDER BY last_failure LIMIT :count)
)sql";

constexpr char kRows[] = R"sql(
  SELECT address, category, attempts, last_failure,
         blocked_until IS NOT NULL AND (blocked_until = 0 OR blocked_until > :now) AS blocked,
         blocked_until
  FROM autoblock ORDER BY blocked DESC, last_failure DESC, address
)sql";

}  // namespace

bool AutoBlockTable::CountFailure(const std::string &address, const std::string &category,
                                  const AutoBlockLimits &limits) {
  bool newly_blocked = false;
  Transaction transaction(connection_);
  {
    Statement count(connection_, kCount);
    count.Bind(":address", address).Bind(":category", category).Bind(":now", now_);
    count.Bind(":limit", limits.attempts).Bind(":within", limits.within);
    count.Bind(":until", limits.block == 0 ? 0 : now_ + limits.block);
    bool first = false;
    while (count.Step()) {
      first = count.Number(0) == 1;
      newly_blocked = !count.IsNull(1);
    }
    if (first) MakeRoomFor(address);
  }
  transaction.Commit();
  return newly_blocked;
}

void AutoBlockTable::Block(const std::string &address, const std::string &category, int64_t until) {
  Transaction transaction(connection_);
  Statement(connection_, kBlock)
      .Bind(":address", address)
      .Bind(":category", category)
      .Bind(":now", now_)
      .Bind(":until", until)
      .Step();
  MakeRoomFor(address);
  transaction.Commit();
}

void AutoBlockTable::Forget(const std::string &address) {
  Statement(connection_, "DELETE FROM autoblock WHERE address = :address")
      .Bind(":address", address)
      .Step();
}

bool AutoBlockTable::IsBlocked(const std::string &address) {
  return Statement(connection_,
                   "SELECT 1 FROM autoblock"
                   " WHERE address = :address AND (blocked_until = 0 OR blocked_until > :now)")
      .Bind(":address", address)
      .Bind(":now", now_)
      .Step();
}

std::vector<AutoBlockRow> AutoBlockTable::Rows() {
  Statement query(connection_, kRows);
  query.Bind(":now", now_);
  std::vector<AutoBlockRow> rows;
  while (query.Step()) {
    rows.push_back({query.Text(0), query.Text(1), query.Number(2), query.Number(3),
                    query.Number(4) != 0, query.Number(5)});
  }
  return rows;
}

void AutoBlockTable::MakeRoomFor(const std::string &newcomer) {
  Statement count(connection_, "SELECT count(*) FROM autoblock");
  count.Step();
  int64_t excess = count.Number(0) - kMostRows;
  if (excess > 0) excess -= Drop(kDropUnblocked, newcomer, excess);
  if (excess > 0) Drop(kDropBlocked, newcomer, excess);
}

int64_t AutoBlockTable::Drop(const char *sql, const std::string &newcomer, int64_t count) {
  Statement(connection_, sql)
      .Bind(":newcomer", newcomer)
      .Bind(":now", now_)
      .Bind(":count", count)
      .Step();
  return connection_.Changes();
}

}  // namespace velk
