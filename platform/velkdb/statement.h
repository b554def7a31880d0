#ifndef VELKDB_STATEMENT_H
#define VELKDB_STATEMENT_H

#include <memory>

#include "durability.h"

struct sqlite3;
struct sqlite3_stmt;

namespace velkdb {

struct StatementDeleter {
  void operator()(sqlite3_stmt *statement) const;
};
using StatementPointer = std::unique_ptr<sqlite3_stmt, StatementDeleter>;

/// One compiled statement.
struct Statement {
  StatementPointer handle;  ///< Null for blanks and comments.
  Effect effect = Effect::kNone;
};

/// How long a compiled statement is meant to be used.
enum class Use { kOnce, kOften };

/// Compiles the first statement of `sql`.
/// @param rest receives where the next one starts; left alone on failure.
/// @return an SQLite result code.
int Prepare(sqlite3 *connection, Durability &durability, const char *sql, Use use,
            Statement &statement, const char *&rest);

/// Brings the effect of a statement that has just been stepped up to date: SQLite prepares a
/// statement anew when the schema has changed, and then it may write something else.
void UpdateEffect(const Durability &durability, Statement &statement);

}  // namespace velkdb

#endif
