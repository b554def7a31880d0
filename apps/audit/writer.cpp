#include "audit/writer.h"

#include <unistd.h>

#include "audit/database.h"
#include "audit/trail.h"

namespace audit {
namespace {

// Within a transaction, safe from several processes at once.
constexpr char kTables[] = R"(
CREATE TABLE IF NOT EXISTS visit (
  id INTEGER PRIMARY KEY AUTOINCREMENT,  -- never used again: who follows the trail remembers one
  time INTEGER NOT NULL,                 -- microseconds since the Unix epoch
  entry_id INTEGER NOT NULL,             -- the link's row in the sharing database
  event INTEGER NOT NULL,                -- 1 login, 2 enter, 3 logout
  result INTEGER NOT NULL,               -- code of the access API
  uid INTEGER,                           -- the session's account; NULL for none
  address TEXT NOT NULL                  -- of the visitor, shortened as configured
);
CREATE INDEX IF NOT EXISTS visit_by_entry_time ON visit (entry_id, time);
CREATE INDEX IF NOT EXISTS visit_by_time ON visit (time);
PRAGMA user_version = 1;
)";

void MakeTables(Database &database) {
  const int64_t version = database.Number("PRAGMA user_version");
  if (version > kTrailVersion)
    throw DatabaseError("version " + std::to_string(version) + ", which a newer program made", 0);
  if (version == 0) database.Run(kTables);
}

void Insert(Statement &insert, const Record &record) {
  insert.Bind(1, record.time)
      .Bind(2, record.entry_id)
      .Bind(3, static_cast<int>(record.event))
      .Bind(4, record.result)
      .Bind(6, record.address);
  if (record.uid) {
    insert.Bind(5, *record.uid);
  } else {
    insert.BindNull(5);
  }
  insert.Execute();
}

}  // namespace

Writer::Writer(std::string path, int patience) : path_(std::move(path)), patience_(patience) {}

Writer::~Writer() = default;

void Writer::Append(const std::vector<Record> &records) {
  if (records.empty()) return;
  InTransaction([&](Database &database) {
    Statement insert(database,
                     "INSERT INTO visit (time, entry_id, event, result, uid, address) "
                     "VALUES (?, ?, ?, ?, ?, ?)");
    for (const Record &record : records) Insert(insert, record);
  });
}

void Writer::RemoveBefore(int64_t time) {
  if (access(path_.c_str(), F_OK) != 0) return;
  InTransaction([time](Database &database) {
    Statement(database, "DELETE FROM visit WHERE time < ?").Bind(1, time).Execute();
  });
}

template <typename Work>
void Writer::InTransaction(const Work &work) {
  try {
    Open();
    database_->Run("BEGIN IMMEDIATE");
    MakeTables(*database_);
    work(*database_);
    database_->Run("COMMIT");
  } catch (const DatabaseError &) {
    // Closing rolls back. The next call begins with whatever file is there then.
    database_.reset();
    throw;
  }
}

void Writer::Open() {
  if (database_ != nullptr && !database_->HasMoved()) return;
  database_.reset();
  auto database = std::make_unique<Database>(path_, Database::Use::WRITE, patience_);
  // Readers do not hold up the writer, nor the disk: a power cut may cost the last records.
  database->Run("PRAGMA journal_mode = WAL");
  database->Run("PRAGMA synchronous = NORMAL");
  database_ = std::move(database);
}

}  // namespace audit
