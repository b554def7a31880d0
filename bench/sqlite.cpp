#include "sqlite.h"

#include <sqlite3.h>

#include <algorithm>
#include <chrono>
#include <thread>

namespace velk_bench {
namespace {

constexpr int kFramesToCheckpoint = 1000;

void Require(int outcome, sqlite3 *connection) {
  if (outcome != SQLITE_OK) throw SqliteError(sqlite3_errmsg(connection));
}

/// SQLite's own busy handler sleeps whole milliseconds, many times longer than a write takes.
/// Whoever measures with several processes replaces it, so the baseline has done so, too.
int WaitForOthers(void *, int attempt) {
  constexpr int kAttempts = 2000;  // about 10 seconds
  const std::chrono::microseconds nominal(50 << std::min(attempt, 7));
  unsigned short chance = 0;
  sqlite3_randomness(sizeof chance, &chance);
  std::this_thread::sleep_for(nominal / 2 + nominal * chance / 65536);
  return attempt < kAttempts ? 1 : 0;
}

int FlushLog(sqlite3 *connection, const char *database) {
  sqlite3_file *log = nullptr;
  const int outcome =
      sqlite3_file_control(connection, database, SQLITE_FCNTL_JOURNAL_POINTER, &log);
  if (outcome != SQLITE_OK) return outcome;
  return log->pMethods->xSync(log, SQLITE_SYNC_NORMAL);
}

}  // namespace

Connection::Connection(const std::string &path) {
  Require(
      sqlite3_open_v2(path.c_str(), &handle_, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr),
      handle_);
  sqlite3_busy_handler(handle_, WaitForOthers, nullptr);
  Run("PRAGMA synchronous = NORMAL; PRAGMA cache_size = 5000; PRAGMA foreign_keys = ON");
  sqlite3_wal_hook(handle_, OnCommit, this);
}

Connection::~Connection() {
  sqlite3_close_v2(handle_);
}

void Connection::Run(const char *sql) {
  Use(Commit::kRelaxed);
  Require(sqlite3_exec(handle_, sql, nullptr, nullptr, nullptr), handle_);
}

std::int64_t Connection::LastInsertId() const {
  return sqlite3_last_insert_rowid(handle_);
}

int Connection::OnCommit(void *connection, sqlite3 *handle, const char *database, int frames) {
  const Commit commit = static_cast<Connection *>(connection)->commit_;
  const int flushed = commit == Commit::kFlushed ? FlushLog(handle, database) : SQLITE_OK;
  if (frames >= kFramesToCheckpoint)
    sqlite3_wal_checkpoint_v2(handle, database, SQLITE_CHECKPOINT_PASSIVE, nullptr, nullptr);
  return flushed;
}

Statement::Statement(Connection &connection, const char *sql, Commit commit)
    : connection_(connection), commit_(commit) {
  Require(sqlite3_prepare_v3(connection.handle(), sql, -1, SQLITE_PREPARE_PERSISTENT, &handle_,
                             nullptr),
          connection.handle());
}

Statement::~Statement() {
  sqlite3_finalize(handle_);
}

Statement &Statement::Bind(int place, std::int64_t number) {
  Require(sqlite3_bind_int64(handle_, place, number), connection_.handle());
  return *this;
}

Statement &Statement::Bind(int place, std::string_view text) {
  Require(
      sqlite3_bind_text(handle_, place, text.data(), static_cast<int>(text.size()), SQLITE_STATIC),
      connection_.handle());
  return *this;
}

void Statement::Run() {
  const Scope scope(*this);
  NextRow();
}

bool Statement::NextRow() {
  connection_.Use(commit_);
  const int outcome = sqlite3_step(handle_);
  if (outcome == SQLITE_ROW) return true;
  if (outcome == SQLITE_DONE) return false;
  throw SqliteError(sqlite3_errmsg(connection_.handle()));
}

int Statement::ColumnCount() const {
  return sqlite3_column_count(handle_);
}

std::int64_t Statement::Number(int column) const {
  return sqlite3_column_int64(handle_, column);
}

std::string_view Statement::Text(int column) const {
  const auto *text = reinterpret_cast<const char *>(sqlite3_column_text(handle_, column));
  if (text == nullptr) return {};
  return {text, static_cast<size_t>(sqlite3_column_bytes(handle_, column))};
}

void Statement::Reset() {
  sqlite3_reset(handle_);
}

}  // namespace velk_bench
