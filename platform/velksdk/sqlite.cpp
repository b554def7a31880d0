#include "sqlite.h"

namespace velk {
namespace {

constexpr int kBusyWaitMilliseconds = 10000;

void Require(bool succeeded, sqlite3 *connection) {
  if (!succeeded) throw SqliteError(sqlite3_errmsg(connection));
}

}  // namespace

Connection::Connection(const std::string &path) {
  sqlite3 *connection = nullptr;
  const int outcome =
      sqlite3_open_v2(path.c_str(), &connection,
                      SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_NOMUTEX, nullptr);
  connection_.reset(connection);
  Require(outcome == SQLITE_OK, connection);
  sqlite3_busy_timeout(connection, kBusyWaitMilliseconds);
  // What a damaged or planted file's own schema says must not run.
  sqlite3_db_config(connection, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(connection, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
}

void Connection::Run(const char *sql) {
  Require(sqlite3_exec(get(), sql, nullptr, nullptr, nullptr) == SQLITE_OK, get());
}

int64_t Connection::Changes() const {
  return sqlite3_changes64(get());
}

Statement::Statement(const Connection &connection, const char *sql)
    : connection_(connection.get()) {
  sqlite3_stmt *statement = nullptr;
  const int outcome = sqlite3_prepare_v2(connection_, sql, -1, &statement, nullptr);
  statement_.reset(statement);
  Require(outcome == SQLITE_OK, connection_);
}

Statement &Statement::Bind(const char *parameter, int64_t value) {
  Require(sqlite3_bind_int64(statement_.get(), Index(parameter), value) == SQLITE_OK, connection_);
  return *this;
}

Statement &Statement::Bind(const char *parameter, const std::string &value) {
  Require(sqlite3_bind_text64(statement_.get(), Index(parameter), value.data(), value.size(),
                              SQLITE_TRANSIENT, SQLITE_UTF8) == SQLITE_OK,
          connection_);
  return *this;
}

bool Statement::Step() {
  const int outcome = sqlite3_step(statement_.get());
  Require(outcome == SQLITE_ROW || outcome == SQLITE_DONE, connection_);
  return outcome == SQLITE_ROW;
}

int64_t Statement::Number(int column) const {
  return sqlite3_column_int64(statement_.get(), column);
}

std::string Statement::Text(int column) const {
  const auto *text = sqlite3_column_text(statement_.get(), column);
  if (text == nullptr) return "";
  return {reinterpret_cast<const char *>(text),
          static_cast<size_t>(sqlite3_column_bytes(statement_.get(), column))};
}

bool Statement::IsNull(int column) const {
  return sqlite3_column_type(statement_.get(), column) == SQLITE_NULL;
}

int Statement::Index(const char *parameter) const {
  return sqlite3_bind_parameter_index(statement_.get(), parameter);
}

Transaction::Transaction(Connection &connection) : connection_(connection) {
  connection_.Run("BEGIN IMMEDIATE");
}

Transaction::~Transaction() {
  // SQLite may have rolled back by itself; then there is nothing left to do.
  if (open_) sqlite3_exec(connection_.get(), "ROLLBACK", nullptr, nullptr, nullptr);
}

void Transaction::Commit() {
  connection_.Run("COMMIT");
  open_ = false;
}

}  // namespace velk
