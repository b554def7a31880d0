#include "support/raw_database.h"

#include <sqlite3.h>

#include <stdexcept>

#include "support/build_folders.h"
#include "support/temp_dir.h"

namespace velk_test {
namespace {

void Require(bool condition, sqlite3 *connection) {
  if (!condition) throw std::runtime_error(sqlite3_errmsg(connection));
}

}  // namespace

RawDatabase::RawDatabase(const std::string &path) {
  Require(sqlite3_open(path.c_str(), &connection_) == SQLITE_OK, connection_);
  sqlite3_busy_timeout(connection_, 10000);
}

RawDatabase::~RawDatabase() {
  sqlite3_close(connection_);
}

void RawDatabase::Run(const std::string &sql) {
  Require(sqlite3_exec(connection_, sql.c_str(), nullptr, nullptr, nullptr) == SQLITE_OK,
          connection_);
}

std::vector<std::vector<std::string>> RawDatabase::Rows(const std::string &sql) {
  std::vector<std::vector<std::string>> rows;
  sqlite3_stmt *statement = nullptr;
  Require(sqlite3_prepare_v2(connection_, sql.c_str(), -1, &statement, nullptr) == SQLITE_OK,
          connection_);
  int outcome;
  while ((outcome = sqlite3_step(statement)) == SQLITE_ROW) {
    std::vector<std::string> row;
    for (int column = 0; column < sqlite3_column_count(statement); ++column) {
      const unsigned char *text = sqlite3_column_text(statement, column);
      const int size = sqlite3_column_bytes(statement, column);
      row.push_back(text == nullptr ? "NULL"
                                    : std::string(reinterpret_cast<const char *>(text),
                                                  static_cast<size_t>(size)));
    }
    rows.push_back(row);
  }
  sqlite3_finalize(statement);
  Require(outcome == SQLITE_DONE, connection_);
  return rows;
}

std::string RawDatabase::Value(const std::string &sql) {
  const auto rows = Rows(sql);
  return rows.empty() ? "" : rows[0][0];
}

void MakeSharingDatabase(const std::string &path) {
  RawDatabase database(path);
  for (const char *script : {"1.sql", "2.sql"}) {
    database.Run(ReadFile(std::string(VELK_SOURCE_DIR) + "/schema/" + script));
  }
}

}  // namespace velk_test
