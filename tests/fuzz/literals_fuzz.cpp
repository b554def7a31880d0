// Any bytes as an SQL text: with its values lifted it must be the same text, and do the same.

#include <sqlite3.h>

#include <algorithm>
#include <cstdint>
#include <string>

#include "binding.h"
#include "literals.h"
#include "require.h"

namespace {

using velk_test::Require;

constexpr char kSchema[] =
    "CREATE TABLE t (id INTEGER PRIMARY KEY, a TEXT, b INTEGER, c REAL, d, e TEXT UNIQUE);"
    "CREATE INDEX i ON t (b) WHERE a = 'x';"
    "INSERT INTO t VALUES (1, 'x', 5, 1.5, NULL, 'e'), (5, '5', 7, -0.0, x'00', 'f');";
constexpr int kMostSteps = 1000;  // of 100 instructions: no text runs for long

/// A text that holds values again where it had them.
std::string PutBack(const velkdb::LiftedText &lifted) {
  std::string sql;
  size_t next = 0;
  char quote = '\0';
  for (const char c : lifted.text) {
    if (quote != '\0' && c == quote) {
      quote = '\0';
    } else if (quote == '\0' && (c == '\'' || c == '"' || c == '`')) {
      quote = c;
    }
    if (c != '?' || quote != '\0') {
      sql += c;
      continue;
    }
    const velkdb::Literal &literal = lifted.literals.at(next++);
    const char *const around = literal.kind == velkdb::Literal::kText ? "'" : "";
    sql.append(around).append(literal.spelling).append(around);
  }
  return sql;
}

struct Outcome {
  int code = SQLITE_OK;
  std::string error;
  std::string rows;
};

int CountSteps(void *steps) {
  return ++*static_cast<int *>(steps) > kMostSteps ? 1 : 0;
}

void AppendRow(sqlite3_stmt *statement, std::string &rows) {
  for (int column = 0; column < sqlite3_column_count(statement); ++column) {
    const auto *text = reinterpret_cast<const char *>(sqlite3_column_text(statement, column));
    const auto size = static_cast<size_t>(sqlite3_column_bytes(statement, column));
    rows.append(sqlite3_column_name(statement, column)).append("=");
    if (text != nullptr) rows.append(text, size);
    rows += '\n';
  }
}

/// A database of its own, in memory.
class Database {
 public:
  Database() {
    sqlite3_open(":memory:", &connection_);
    sqlite3_exec(connection_, kSchema, nullptr, nullptr, nullptr);
    sqlite3_progress_handler(connection_, 100, CountSteps, &steps_);
  }
  Database(const Database &) = delete;
  Database &operator=(const Database &) = delete;
  ~Database() { sqlite3_close(connection_); }

  sqlite3_stmt *Prepare(const std::string &sql) {
    sqlite3_stmt *statement = nullptr;
    sqlite3_prepare_v2(connection_, sql.c_str(), -1, &statement, nullptr);
    return statement;
  }

  Outcome Step(sqlite3_stmt *statement) {
    Outcome outcome;
    while ((outcome.code = sqlite3_step(statement)) == SQLITE_ROW)
      AppendRow(statement, outcome.rows);
    outcome.error = sqlite3_errmsg(connection_);
    return outcome;
  }

 private:
  sqlite3 *connection_ = nullptr;
  int steps_ = 0;
};

Outcome RunLifted(Database &database, sqlite3_stmt *statement, const velkdb::LiftedText &lifted) {
  Require(sqlite3_bind_parameter_count(statement) == static_cast<int>(lifted.literals.size()));
  const velkdb::BindingScope binding(statement, lifted.literals);
  Require(binding.outcome() == SQLITE_OK);
  return database.Step(statement);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  std::string sql(reinterpret_cast<const char *>(data), size);
  sql.resize(std::min(sql.find('\0'), sql.size()));  // the connection gets no more either
  velkdb::LiftedText lifted;
  if (!velkdb::LiftLiterals(sql, lifted)) return 0;
  Require(PutBack(lifted) == sql);

  Database with_values;
  sqlite3_stmt *const statement = with_values.Prepare(lifted.text);
  if (statement == nullptr) return 0;  // then the text runs as it came
  const Outcome outcome = RunLifted(with_values, statement, lifted);
  sqlite3_finalize(statement);
  if (outcome.code == SQLITE_INTERRUPT) return 0;

  Database plain;
  sqlite3_stmt *const plain_statement = plain.Prepare(sql);
  Require(plain_statement != nullptr);
  const Outcome expected = plain.Step(plain_statement);
  sqlite3_finalize(plain_statement);
  Require(expected.code == SQLITE_INTERRUPT ||
          (outcome.code == expected.code && outcome.error == expected.error &&
           outcome.rows == expected.rows));
  return 0;
}
