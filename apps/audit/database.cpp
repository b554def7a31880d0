#include "audit/database.h"

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

namespace audit {
namespace {

[[noreturn]] void Fail(sqlite3 *connection, int code) {
  const std::string text =
      connection == nullptr ? sqlite3_errstr(code) : sqlite3_errmsg(connection);
  throw DatabaseError(text, code);
}

std::string ErrorText(int error) {
  return std::generic_category().message(error);
}

/// SQLite would let everybody read what it makes. An existing file is not even opened: closing it
/// again would take away locks that this process may have on it.
void MakeFile(const std::string &path) {
  const int file = open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
  if (file >= 0) {
    close(file);
  } else if (errno != EEXIST) {
    throw DatabaseError(ErrorText(errno), SQLITE_CANTOPEN);
  }
}

void RequireFile(const std::string &path) {
  if (access(path.c_str(), F_OK) != 0)
    throw DatabaseError(ErrorText(errno), errno == ENOENT ? SQLITE_NOTFOUND : SQLITE_CANTOPEN);
}

/// SQLite's own text tells little of why it cannot open a file.
DatabaseError OpenError(sqlite3 *connection, int outcome) {
  const int error = connection == nullptr ? 0 : sqlite3_system_errno(connection);
  return {error == 0 ? sqlite3_errstr(outcome) : ErrorText(error), outcome};
}

}  // namespace

bool DatabaseError::IsBusy() const {
  const int primary = code_ & 0xff;
  return primary == SQLITE_BUSY || primary == SQLITE_LOCKED;
}

bool DatabaseError::IsMissing() const {
  return code_ == SQLITE_NOTFOUND;
}

Database::Database(const std::string &path, Use use, int patience) {
  use == Use::WRITE ? MakeFile(path) : RequireFile(path);
  // Readers of a log write to its index.
  constexpr int kFlags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_NOMUTEX;
  const int outcome = sqlite3_open_v2(path.c_str(), &connection_, kFlags, nullptr);
  if (outcome != SQLITE_OK) {
    const DatabaseError error = OpenError(connection_, outcome);
    sqlite3_close(connection_);
    throw error;
  }
  sqlite3_extended_result_codes(connection_, 1);
  sqlite3_busy_timeout(connection_, patience);
  sqlite3_db_config(connection_, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(connection_, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
}

Database::~Database() {
  sqlite3_close(connection_);
}

void Database::Run(const char *sql) {
  const int outcome = sqlite3_exec(connection_, sql, nullptr, nullptr, nullptr);
  if (outcome != SQLITE_OK) Fail(connection_, outcome);
}

int64_t Database::Number(const char *sql) {
  Statement statement(*this, sql);
  return statement.Step() ? statement.Number(0) : 0;
}

bool Database::HasMoved() {
  int has_moved = 0;
  sqlite3_file_control(connection_, "main", SQLITE_FCNTL_HAS_MOVED, &has_moved);
  return has_moved != 0;
}

Statement::Statement(Database &database, const char *sql) : connection_(database.connection()) {
  Check(sqlite3_prepare_v2(connection_, sql, -1, &statement_, nullptr));
}

Statement::~Statement() {
  sqlite3_finalize(statement_);
}

Statement &Statement::Bind(int place, int64_t value) {
  Check(sqlite3_bind_int64(statement_, place, value));
  return *this;
}

Statement &Statement::Bind(int place, const std::string &value) {
  Check(sqlite3_bind_text(statement_, place, value.data(), static_cast<int>(value.size()),
                          SQLITE_TRANSIENT));
  return *this;
}

Statement &Statement::BindNull(int place) {
  Check(sqlite3_bind_null(statement_, place));
  return *this;
}

bool Statement::Step() {
  const int outcome = sqlite3_step(statement_);
  if (outcome == SQLITE_ROW) return true;
  if (outcome != SQLITE_DONE) Fail(connection_, outcome);
  return false;
}

void Statement::Execute() {
  while (Step()) {
  }
  Check(sqlite3_reset(statement_));
}

int64_t Statement::Number(int column) const {
  return sqlite3_column_int64(statement_, column);
}

bool Statement::IsNull(int column) const {
  return sqlite3_column_type(statement_, column) == SQLITE_NULL;
}

std::string Statement::Text(int column) const {
  const auto *text = reinterpret_cast<const char *>(sqlite3_column_text(statement_, column));
  return text == nullptr
             ? ""
             : std::string(text, static_cast<size_t>(sqlite3_column_bytes(statement_, column)));
}

void Statement::Check(int outcome) {
  if (outcome != SQLITE_OK) Fail(connection_, outcome);
}

}  // namespace audit
