#include "audit/reader.h"

#include "audit/database.h"
#include "audit/trail.h"

namespace audit {
namespace {

constexpr int kPatience = 10'000;  // milliseconds

// By time, for which there is an index with the link. Two records of one moment keep their order.
constexpr char kSelect[] = R"(
SELECT * FROM (
  SELECT id, time, event, result, uid, address FROM visit
  WHERE entry_id = ? AND time >= ? AND id > ? AND id <= ?
  ORDER BY time DESC, id DESC LIMIT ?)
ORDER BY time, id
)";

Record RecordOf(const Statement &row, int entry_id) {
  Record record;
  record.time = row.Number(1);
  record.entry_id = entry_id;
  record.event = static_cast<Event>(row.Number(2));
  record.result = static_cast<int>(row.Number(3));
  if (!row.IsNull(4)) record.uid = static_cast<unsigned int>(row.Number(4));
  record.address = row.Text(5);
  return record;
}

}  // namespace

Reader::Reader(const std::string &path)
    : database_(std::make_unique<Database>(path, Database::Use::READ, kPatience)) {
  database_->Run("PRAGMA query_only = ON");
}

Reader::~Reader() = default;

int64_t Reader::Read(const Query &query, const std::function<void(const Record &)> &take) {
  const int64_t version = database_->Number("PRAGMA user_version");
  if (version == 0) return 0;
  if (version > kTrailVersion)
    throw DatabaseError("version " + std::to_string(version) + ", which a newer program made", 0);
  const int64_t last = database_->Number("SELECT max(id) FROM visit");
  Statement rows(*database_, kSelect);
  rows.Bind(1, query.entry_id).Bind(2, query.since).Bind(3, query.after_id).Bind(4, last);
  rows.Bind(5, query.limit);
  while (rows.Step()) take(RecordOf(rows, query.entry_id));
  return last;
}

bool Reader::HasMoved() {
  return database_->HasMoved();
}

}  // namespace audit
