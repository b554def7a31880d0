#include "statement.h"

#include <sqlite3.h>

namespace velkdb {
namespace {

Effect EffectOf(sqlite3_stmt *statement, Effect seen) {
  // SQLite calls a PRAGMA that changes a setting of the connection read-only.
  if (statement == nullptr || seen == Effect::kStructure) return seen;
  if (sqlite3_stmt_readonly(statement) != 0) return Effect::kNone;
  // VACUUM writes, but shows nothing while it is prepared.
  return seen == Effect::kNone ? Effect::kRows : seen;
}

}  // namespace

void StatementDeleter::operator()(sqlite3_stmt *statement) const {
  sqlite3_finalize(statement);
}

int Prepare(sqlite3 *connection, Durability &durability, const char *sql, Use use,
            Statement &statement, const char *&rest) {
  const unsigned int flags = use == Use::kOften ? SQLITE_PREPARE_PERSISTENT : 0;
  sqlite3_stmt *handle = nullptr;
  const char *tail = nullptr;
  durability.Watch();
  const int outcome = sqlite3_prepare_v3(connection, sql, -1, flags, &handle, &tail);
  if (outcome != SQLITE_OK) return outcome;
  statement.handle.reset(handle);
  statement.effect = EffectOf(handle, durability.Watched());
  rest = tail;
  return SQLITE_OK;
}

void UpdateEffect(const Durability &durability, Statement &statement) {
  if (durability.Watched() != Effect::kNone)
    statement.effect = EffectOf(statement.handle.get(), durability.Watched());
}

}  // namespace velkdb
