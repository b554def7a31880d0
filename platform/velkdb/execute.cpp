#include <sqlite3.h>

#include <climits>
#include <memory>
#include <new>

#include "binding.h"
#include "connection.h"
#include "result.h"
#include "statement.h"
#include "velk/velkdb.h"

namespace velkdb {
namespace {

using ResultPointer = std::unique_ptr<DBResult>;

bool InTransaction(const VELKDBHandle &handle) {
  return sqlite3_get_autocommit(handle.sqlite.get()) == 0;
}

void KeepError(VELKDBHandle &handle, const char *text) noexcept {
  try {
    handle.error = text;
  } catch (const std::bad_alloc &) {
    handle.error = "out of memory";  // short enough to need none
  }
}

/// The time that one statement may wait for others.
class WaitScope {
 public:
  explicit WaitScope(BusyWait &wait) : wait_(wait) { wait_.StartStatement(); }
  WaitScope(const WaitScope &) = delete;
  WaitScope &operator=(const WaitScope &) = delete;
  ~WaitScope() { wait_.EndStatement(); }

 private:
  BusyWait &wait_;
};

/// While a statement is stepped: what it writes counts for its transaction.
class EffectScope {
 public:
  EffectScope(Durability &durability, Effect effect) : durability_(durability) {
    durability_.Start(effect);
  }
  EffectScope(const EffectScope &) = delete;
  EffectScope &operator=(const EffectScope &) = delete;
  ~EffectScope() { durability_.Finish(); }

 private:
  Durability &durability_;
};

ResultPointer EmptyResult(sqlite3_stmt *statement) {
  std::vector<std::string> names;
  for (int column = 0; column < sqlite3_column_count(statement); ++column) {
    const char *name = sqlite3_column_name(statement, column);
    if (name == nullptr) throw std::bad_alloc();
    names.emplace_back(name);
  }
  return std::make_unique<DBResult>(names);
}

void AppendRow(sqlite3_stmt *statement, DBResult &result) {
  if (result.RowCount() == UINT_MAX) throw std::bad_alloc();  // past what a row's number can say
  for (int column = 0; column < sqlite3_column_count(statement); ++column) {
    const bool is_null = sqlite3_column_type(statement, column) == SQLITE_NULL;
    const auto *text = reinterpret_cast<const char *>(sqlite3_column_text(statement, column));
    if (text == nullptr && !is_null) throw std::bad_alloc();
    const auto size = static_cast<size_t>(sqlite3_column_bytes(statement, column));
    result.Append(text == nullptr ? std::string_view() : std::string_view(text, size));
  }
}

/// Steps a statement to its end and collects its rows, if it yields columns.
/// Gives an SQLite result code; SQLITE_DONE is success.
int StepToEnd(sqlite3_stmt *statement, bool wants_rows, ResultPointer &rows) {
  rows.reset();
  int outcome = sqlite3_step(statement);
  // Only now: the first step may have compiled the statement anew, with other columns.
  if (wants_rows && sqlite3_column_count(statement) > 0) rows = EmptyResult(statement);
  for (; outcome == SQLITE_ROW; outcome = sqlite3_step(statement)) {
    if (rows != nullptr) AppendRow(statement, *rows);
  }
  return outcome;
}

/// Compiles and runs the first statement of `sql` once.
int RunOnce(VELKDBHandle &handle, const char *sql, const char *&rest, bool wants_rows,
            ResultPointer &rows) {
  Statement statement;
  const int prepared =
      Prepare(handle.sqlite.get(), handle.durability, sql, Use::kOnce, statement, rest);
  if (prepared != SQLITE_OK) return prepared;
  if (statement.handle == nullptr) return SQLITE_DONE;

  const EffectScope effect(handle.durability, statement.effect);
  ResultPointer own_rows;
  const int outcome = StepToEnd(statement.handle.get(), wants_rows, own_rows);
  if (own_rows != nullptr) rows = std::move(own_rows);
  return outcome;
}

/// Runs a compiled statement once with these values.
int RunBound(VELKDBHandle &handle, Statement &statement, const std::vector<Literal> &values,
             bool wants_rows, ResultPointer &rows) {
  const BindingScope binding(statement.handle.get(), values);
  if (binding.outcome() != SQLITE_OK) return binding.outcome();
  const EffectScope effect(handle.durability, statement.effect);
  const int outcome = StepToEnd(statement.handle.get(), wants_rows, rows);
  UpdateEffect(handle.durability, statement);
  return outcome;
}

/// Some locks SQLite does not wait for at all, the one for the switch to WAL among them. Outside of
/// a transaction nothing is lost by running the statement again, so the wait is ours.
/// @param run runs a statement once and gives an SQLite result code; SQLITE_DONE is success.
template <typename Run>
bool RunPatiently(VELKDBHandle &handle, const Run &run) {
  const WaitScope wait(handle.busy_wait);
  if (handle.durability.Refresh()) handle.statements.Clear();
  const bool may_repeat = !InTransaction(handle);
  int outcome = run();
  for (int attempt = 0; outcome == SQLITE_BUSY && may_repeat && handle.busy_wait.Sleep(attempt);
       ++attempt) {
    outcome = run();
  }
  if (outcome == SQLITE_DONE) return true;
  KeepError(handle, sqlite3_errmsg(handle.sqlite.get()));
  return false;
}

/// Runs the one statement of `sql`, which has been lifted.
bool RunLifted(VELKDBHandle &handle, const char *sql, bool wants_rows, ResultPointer &rows) {
  return RunPatiently(handle, [&] {
    Statement *const statement =
        handle.statements.Get(handle.sqlite.get(), handle.durability, handle.lifted.text);
    if (statement != nullptr)
      return RunBound(handle, *statement, handle.lifted.literals, wants_rows, rows);
    // It may not hold values in such places, or it is wrong: then its own text tells how.
    const char *rest = sql;
    return RunOnce(handle, sql, rest, wants_rows, rows);
  });
}

/// `opens_transaction` tells, also on failure, whether a transaction open now is this script's own.
bool RunScript(VELKDBHandle &handle, const char *sql, bool wants_rows, ResultPointer &rows,
               bool &opens_transaction) {
  while (*sql != '\0') {
    opens_transaction = opens_transaction || !InTransaction(handle);
    const char *rest = sql;
    if (!RunPatiently(handle, [&] { return RunOnce(handle, sql, rest, wants_rows, rows); }))
      return false;
    sql = rest;
  }
  return true;
}

/// Not through the script's own path: the text of the failure is to stay.
void RollBack(VELKDBHandle &handle) {
  if (!InTransaction(handle)) return;  // some failures have done it already
  const EffectScope effect(handle.durability, Effect::kNone);
  sqlite3_exec(handle.sqlite.get(), "ROLLBACK", nullptr, nullptr, nullptr);
}

bool Execute(VELKDBHandle &handle, const char *sql, bool wants_rows, ResultPointer &rows) {
  bool opens_transaction = false;
  bool done = false;
  try {
    done = LiftLiterals(sql, handle.lifted)
               ? RunLifted(handle, sql, wants_rows, rows)
               : RunScript(handle, sql, wants_rows, rows, opens_transaction);
  } catch (const std::bad_alloc &) {
    KeepError(handle, "out of memory");
  }
  if (!done && opens_transaction) RollBack(handle);
  return done;
}

}  // namespace
}  // namespace velkdb

int VELKDBExecute(VELKDBHandle *handle, const char *sql, DBResult **result) {
  if (result != nullptr) *result = nullptr;
  if (handle == nullptr) return -1;
  if (sql == nullptr) {
    velkdb::KeepError(*handle, "no statement given");
    return -1;
  }
  velkdb::ResultPointer rows;
  if (!velkdb::Execute(*handle, sql, result != nullptr, rows)) return -1;
  if (result != nullptr) *result = rows.release();
  return 0;
}
