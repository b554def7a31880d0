#include "operations/maintenance.h"

#include <sys/stat.h>

#include "operations/moment.h"
#include "velksharing/constants.h"
#include "velksharing/record.h"
#include "velksharing/utils.h"

namespace operations {
namespace {

using namespace VELK::sharing;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;

/// Rows read at a time: links may hold large documents.
constexpr int kBatch = 100;

long FileSize(const std::string &path) {
  struct stat info = {};
  return stat(path.c_str(), &info) == 0 ? static_cast<long>(info.st_size) : 0;
}

int CountRows(BaseDB &db, const char *table, const std::string &expression) {
  return static_cast<int>(
      ReadNumber(db, std::string("SELECT COUNT(*) AS n FROM ") + table + " WHERE " + expression));
}

std::vector<std::string> IntegrityProblems(BaseDB &db) {
  Result result;
  if (!db.Execute("PRAGMA integrity_check", result))
    return {"the check itself failed: " + db.GetLastError()};
  std::vector<std::string> problems;
  for (Row row; result.NextRow(row);) {
    const std::string text = row.GetField("integrity_check").AsString("");
    std::vector<std::string> lines;
    if (text != "ok" && StringExplode(lines, text, "\n"))
      problems.insert(problems.end(), lines.begin(), lines.end());
  }
  return problems;
}

/// Looks at the links behind `id` and moves it on.
/// @return false when there are none.
bool CheckNextLinks(BaseDB &db, int &id, CheckReport &report) {
  Result result;
  if (!db.Execute("SELECT * FROM entry WHERE id > " + std::to_string(id) + " ORDER BY id LIMIT " +
                      std::to_string(kBatch),
                  result)) {
    throw DatabaseFailure(db, "the links could not be read");
  }
  bool any = false;
  for (Row row; result.NextRow(row); any = true) {
    id = row.GetField(SZK_ID_).AsInt(id);
    ++report.links;
    record::Entry link;
    if (!link.FromRow(row))
      report.damaged_links.push_back({id, row.GetField(SZK_HASH).AsString("")});
  }
  return any;
}

}  // namespace

FileSizes DatabaseSizes() {
  const std::string path = SZF_SHARING_DB_PATH;
  return {FileSize(path), FileSize(path + "-wal")};
}

DatabaseStatus Status(BaseDB &db) {
  const long now = Now();
  const std::string live = "timeout > " + std::to_string(now);
  const std::string lapsed = "timeout <= " + std::to_string(now);
  const Transaction snapshot(db, Transaction::SNAPSHOT);

  DatabaseStatus status;
  status.path = SZF_SHARING_DB_PATH;
  status.version =
      static_cast<int>(ReadNumber(db, "SELECT user_version AS n FROM pragma_user_version"));
  Result result;
  Row row;
  if (db.Execute("PRAGMA journal_mode", result) && result.NextRow(row))
    status.journal_mode = row.GetField("journal_mode").AsString("");
  status.sizes = DatabaseSizes();
  status.links = CountRows(db, "entry", "1");
  for (std::size_t i = 0; i < kLinkStates.size(); ++i)
    status.links_by_state[i] = CountRows(db, "entry", LinkStateExpression(kLinkStates[i], now));
  status.live_sessions = CountRows(db, "session", live);
  status.lapsed_sessions = CountRows(db, "session", lapsed);
  status.live_grants = CountRows(db, "token", live);
  status.lapsed_grants = CountRows(db, "token", lapsed);
  return status;
}

CheckReport CheckDatabase(BaseDB &db) {
  const Transaction snapshot(db, Transaction::SNAPSHOT);
  CheckReport report;
  report.problems = IntegrityProblems(db);
  for (int id = 0; CheckNextLinks(db, id, report);) {
  }
  return report;
}

void Vacuum(BaseDB &db) {
  if (!db.Vacuum()) throw DatabaseFailure(db, "the database could not be rebuilt");
  if (!db.Execute("PRAGMA wal_checkpoint(TRUNCATE)"))
    throw DatabaseFailure(db, "the log could not be written into the database");
}

}  // namespace operations
