#include "plain_database.h"

#include <sqlite3.h>

#include <stdexcept>

namespace velk_test {
namespace {

std::string Text(sqlite3_stmt *statement, int column) {
  const auto *text = reinterpret_cast<const char *>(sqlite3_column_text(statement, column));
  return text == nullptr ? "" : text;
}

std::vector<std::string> Columns(sqlite3_stmt *statement) {
  std::vector<std::string> names;
  for (int column = 0; column < sqlite3_column_count(statement); ++column)
    names.emplace_back(sqlite3_column_name(statement, column));
  return names;
}

std::vector<std::string> Row(sqlite3_stmt *statement) {
  std::vector<std::string> row;
  for (int column = 0; column < sqlite3_column_count(statement); ++column)
    row.push_back(Text(statement, column));
  return row;
}

}  // namespace

PlainDatabase::PlainDatabase(const std::string &path) {
  if (sqlite3_open_v2(path.c_str(), &connection_, SQLITE_OPEN_READWRITE, nullptr) != SQLITE_OK)
    throw std::runtime_error("cannot open " + path);
  sqlite3_db_config(connection_, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(connection_, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
}

PlainDatabase::~PlainDatabase() {
  sqlite3_close(connection_);
}

Outcome PlainDatabase::Run(const char *sql) {
  Outcome outcome;
  bool opens_transaction = false;
  while (*sql != '\0') {
    opens_transaction = opens_transaction || !InTransaction();
    if (RunFirst(sql, outcome)) continue;
    outcome.error = sqlite3_errmsg(connection_);
    if (opens_transaction && InTransaction())
      sqlite3_exec(connection_, "ROLLBACK", nullptr, nullptr, nullptr);
    return outcome;
  }
  outcome.done = true;
  return outcome;
}

bool PlainDatabase::InTransaction() const {
  return sqlite3_get_autocommit(connection_) == 0;
}

bool PlainDatabase::RunFirst(const char *&sql, Outcome &outcome) {
  sqlite3_stmt *statement = nullptr;
  if (sqlite3_prepare_v2(connection_, sql, -1, &statement, &sql) != SQLITE_OK) return false;
  if (statement == nullptr) return true;
  int step = sqlite3_step(statement);  // may compile the statement anew, with other columns
  if (sqlite3_column_count(statement) > 0) {
    outcome.columns = Columns(statement);
    outcome.rows.clear();
  }
  for (; step == SQLITE_ROW; step = sqlite3_step(statement)) outcome.rows.push_back(Row(statement));
  return sqlite3_finalize(statement) == SQLITE_OK && step == SQLITE_DONE;
}

}  // namespace velk_test
