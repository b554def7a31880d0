#include "durability.h"

#include <sqlite3.h>

#include <algorithm>
#include <cstring>

#include "statement.h"

namespace velkdb {
namespace {

// SQLite's own hook, replaced by ours, takes 1000. A checkpoint waits for the disk twice, and
// writes a page once that was changed many times: sessions and grants change at each check.
constexpr int kFramesToCheckpoint = 1000;
constexpr char kListTable[] = "velkdb_relaxed";

bool SameName(const char *a, const char *b) {
  return sqlite3_stricmp(a, b) == 0;
}

/// `first` and `second` are what SQLite tells about the action: the table, for changes of rows.
Effect EffectOf(const Durability &durability, int action, const char *first, const char *second,
                const char *database) {
  switch (action) {
    case SQLITE_SELECT:
    case SQLITE_READ:
    case SQLITE_FUNCTION:
    case SQLITE_RECURSIVE:
      return Effect::kNone;
    case SQLITE_TRANSACTION:
    case SQLITE_SAVEPOINT:
      return Effect::kTransaction;
    case SQLITE_PRAGMA:  // the second is its argument
      return second == nullptr ? Effect::kNone : Effect::kStructure;
    case SQLITE_INSERT:
    case SQLITE_UPDATE:
      if (durability.IsRelaxed(database, first)) return Effect::kRelaxedRows;
      [[fallthrough]];
    case SQLITE_DELETE:
      return SameName(first, kListTable) ? Effect::kStructure : Effect::kRows;
    default:
      return Effect::kStructure;
  }
}

int OnAction(void *durability, int action, const char *first, const char *second,
             const char *database, const char * /*trigger*/) {
  auto *self = static_cast<Durability *>(durability);
  self->See(EffectOf(*self, action, first, second, database));
  return SQLITE_OK;
}

int OnCommit(void *durability, sqlite3 * /*connection*/, const char *database, int frames) {
  return static_cast<Durability *>(durability)->Committed(database, frames);
}

int FlushLog(sqlite3 *connection, const char *database) {
  sqlite3_file *log = nullptr;
  const int outcome =
      sqlite3_file_control(connection, database, SQLITE_FCNTL_JOURNAL_POINTER, &log);
  if (outcome != SQLITE_OK) return outcome;
  if (log == nullptr || log->pMethods == nullptr) return SQLITE_IOERR_FSYNC;
  return log->pMethods->xSync(log, SQLITE_SYNC_NORMAL);
}

/// False when the file cannot be read; a file without the list is read well, and lists nothing.
bool ReadList(sqlite3 *connection, std::vector<std::string> &names) {
  sqlite3_stmt *raw = nullptr;
  const int prepared =
      sqlite3_prepare_v2(connection, "SELECT name FROM main.velkdb_relaxed", -1, &raw, nullptr);
  const StatementPointer list(raw);
  if (prepared != SQLITE_OK) return prepared == SQLITE_ERROR;
  int outcome;
  while ((outcome = sqlite3_step(raw)) == SQLITE_ROW) {
    const auto *name = reinterpret_cast<const char *>(sqlite3_column_text(raw, 0));
    if (name != nullptr) names.emplace_back(name);
  }
  return outcome == SQLITE_DONE;
}

}  // namespace

void Durability::Attach(sqlite3 *connection) {
  connection_ = connection;
  sqlite3_set_authorizer(connection, OnAction, this);
}

bool Durability::Refresh() {
  if (current_ || sqlite3_get_autocommit(connection_) == 0) return false;
  relaxed_.clear();
  std::vector<std::string> names;
  current_ = sqlite3_exec(connection_, "PRAGMA synchronous = NORMAL", nullptr, nullptr, nullptr) ==
                 SQLITE_OK &&
             ReadList(connection_, names);
  if (current_) relaxed_ = std::move(names);
  return true;
}

void Durability::Watch() {
  seen_ = Effect::kNone;
}

void Durability::Start(Effect effect) {
  transaction_ = std::max(transaction_, effect);
  seen_ = Effect::kNone;
  // Each time: PRAGMA wal_autocheckpoint puts SQLite's own hook in its place.
  sqlite3_wal_hook(connection_, OnCommit, this);
}

void Durability::Finish() {
  transaction_ = std::max(transaction_, seen_);
  if (sqlite3_get_autocommit(connection_) == 0) return;
  if (transaction_ == Effect::kStructure) current_ = false;
  transaction_ = Effect::kNone;
}

void Durability::See(Effect effect) {
  seen_ = std::max(seen_, effect);
}

int Durability::Committed(const char *database, int frames) {
  // A statement that SQLite prepared anew while stepping may write more than it was seen to.
  const Effect effect = std::max(transaction_, seen_);
  const int flushed = effect > Effect::kRelaxedRows ? FlushLog(connection_, database) : SQLITE_OK;
  if (IsTimeToCheckpoint(frames))
    sqlite3_wal_checkpoint_v2(connection_, database, SQLITE_CHECKPOINT_PASSIVE, nullptr, nullptr);
  return flushed;
}

// One that cannot be made now, or not of everything, is tried again much later, and not at each
// commit until the log begins anew: each try waits for the disk.
bool Durability::IsTimeToCheckpoint(int frames) {
  if (frames < kFramesToCheckpoint) next_checkpoint_ = kFramesToCheckpoint;
  if (frames < next_checkpoint_) return false;
  next_checkpoint_ = frames + kFramesToCheckpoint;
  return true;
}

bool Durability::IsRelaxed(const char *database, const char *table) const {
  if (database == nullptr || std::strcmp(database, "main") != 0) return false;
  return std::any_of(relaxed_.begin(), relaxed_.end(),
                     [table](const std::string &name) { return SameName(name.c_str(), table); });
}

}  // namespace velkdb
