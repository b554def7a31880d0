#ifndef VELKSHARING_DATABASE_H
#define VELKSHARING_DATABASE_H

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "velksharing/export.h"

/// The database layer: one connection, its results, conditions of queries, and the sharing
/// database itself. It knows no record.
///
///     BaseDB db("/srv/app/app.db", 0660);
///     Result result;
///     Row row;
///     if (db.Execute("SELECT name FROM item WHERE owner = '" + db.Escape(owner) + "'", result))
///       while (result.NextRow(row)) puts(row.GetField("name").AsString("").c_str());
///
/// Operations report success as bool and throw nothing on a database failure. A connection and
/// all that was made on it belong to one thread at a time and must not cross fork().

struct DBResult_tag;  // the platform's result set

namespace VELK {
namespace sharing {
namespace db {

class BaseDBPrivate;
class ConditionPrivate;
class SharingDBPrivate;

/// One column's value in one row: its text, converted on demand.
///
/// The numeric conversions read one number from the start of the text, as formatted stream
/// extraction does: leading blanks are skipped, what follows the number is ignored. No number,
/// or one out of the type's range, gives the default. A Field is good for one conversion: after
/// one that failed or read to the end of the text, every further one gives its default.
class VELK_EXPORT Field {
 public:
  explicit Field(const std::string &text);
  explicit Field(std::string &&text) noexcept;
  Field(const Field &other);
  Field(Field &&other) noexcept;
  Field &operator=(const Field &other);
  Field &operator=(Field &&other) noexcept;
  virtual ~Field();

  /// Goes back to the start of the text. Does not make a used-up Field convert again.
  void Clear();

  int AsInt(int def);
  unsigned int AsUInt(unsigned int def);
  long AsTime(long def);  ///< Seconds since the Unix epoch.
  float AsFloat(float def);
  /// The text itself, valid as long as the Field; `def` is not used.
  const std::string &AsString(const std::string &def);
  /// True exactly when the text is "1"; `def` is not used.
  bool AsBool(bool def);

 private:
  std::string text_;
  bool used_up_ = false;
};

/// One row of a result. Owns nothing; valid while the Result that it came from lives.
class VELK_EXPORT Row {
 public:
  Row();
  Row(DBResult_tag *result, unsigned int row);
  Row(const Row &other);
  Row &operator=(const Row &other);
  virtual ~Row();

  bool IsGood() const;  ///< Whether the row belongs to a result.
  void SetResult(DBResult_tag *result);
  void SetRow(unsigned int row);

  /// The value of a column, by its name in the statement's output ("c" for
  /// "SELECT COUNT(*) AS c"). Empty for SQL NULL, an unknown column, and a row that is not good.
  Field GetField(const std::string &name) const;

 private:
  DBResult_tag *result_ = nullptr;
  unsigned int row_ = 0;
};

/// The rows of one statement, walked once from the first to the last. Owns the platform's result
/// set and frees it.
class VELK_EXPORT Result {
 public:
  Result();
  explicit Result(DBResult_tag *handle);  ///< Takes ownership of `handle`.
  Result(const Result &) = delete;
  Result &operator=(const Result &) = delete;
  virtual ~Result();

  bool IsGood() const;  ///< Whether there is a result set (it may have no rows).

  /// Takes ownership of `handle`. One held before is not freed: hand over a fresh Result only.
  void SetResult(DBResult_tag *handle);

  /// Moves to the next row; the first call gives the first.
  /// @return false, with `row` left alone, when no row is left.
  bool NextRow(Row &row);

 private:
  unsigned int row_ = 0;
  DBResult_tag *handle_ = nullptr;
};

/// A connection to one SQLite file.
///
/// The constructor makes the file when it is missing and connects; both happen with the
/// process's effective ids switched to the system account and back. Whether all of that worked
/// says IsGood(), for the life of the object: there is no reconnecting, and every operation on a
/// connection that is not good fails.
class VELK_EXPORT BaseDB {
 public:
  /// @param mode permission bits of a newly made file; an existing file keeps its own.
  BaseDB(const std::string &path, unsigned int mode);
  BaseDB(const BaseDB &) = delete;
  BaseDB &operator=(const BaseDB &) = delete;
  virtual ~BaseDB();

  bool IsGood() const;  ///< Connected and set up.

  /// Runs the statements of `sql`.
  /// @param result receives the rows, when given; must be fresh. Not good after a failure and
  ///        after statements that yield no columns; one that selects no row is good.
  /// @return false when a statement failed; GetLastError() tells why.
  bool Execute(const std::string &sql, Result *result = nullptr);
  bool Execute(const std::string &sql, Result &result);

  std::string GetLastError() const;  ///< Of the last failed statement; "" before the first.
  std::string GetLastQuery() const;  ///< The last statement run; "" before the first.

  /// @param id receives the row id of the last row inserted on this connection.
  /// @return false, with `id` left alone, when the connection is not good.
  bool GetLastInsertId(int &id) const;

  bool Begin();   ///< Opens a transaction. They do not nest.
  bool Commit();  ///< Commits; rolls back and returns false when that fails.
  bool Vacuum();  ///< Rebuilds the file without its free pages.

  /// The text made safe between single quotes of an SQL literal; the quotes are not added. Cut at
  /// a zero byte.
  std::string Escape(const std::string &text) const;

  /// INSERT of one row: NULL for the id, then `values` in the order of the table's columns.
  /// The table name is used as it is and must not come from outside.
  bool Insert(const std::string &table, const std::vector<std::string> &values);

  /// UPDATE of the row `id` with every column of `columns` but "id". Fails when that leaves
  /// none. Table and column names must not come from outside.
  bool Update(const std::string &table, const std::map<std::string, std::string> &columns, int id);

  /// DELETE of the row `id`. A row that does not exist is no failure.
  bool Delete(const std::string &table, int id);

 private:
  std::unique_ptr<BaseDBPrivate> private_;
};

/// Filter, order and page of one query, rendered as the tail of an SQL statement.
///
/// A store owns one Condition; fill it right before Count() or Query(), which use it up:
///
///     EntryDB links(SharingDB::Instance());
///     links.GetCondition().Where(SZK_PROJECT_NAME, "photo").OrderBy(SZK_ID_, true).Page(1, 50);
///     std::vector<record::Entry> page;
///     bool ok = links.Query(page);
///
/// Terms are joined without brackets, so AND binds tighter than OR. Values are escaped; columns
/// and expressions are not made safe and must never come from outside.
class VELK_EXPORT Condition {
 public:
  explicit Condition(BaseDB &db);  ///< `db` must outlive this; it does the escaping.
  Condition(const Condition &) = delete;
  Condition &operator=(const Condition &) = delete;
  virtual ~Condition();

  /// Adds an SQL expression, joined with AND. Ignored when empty.
  Condition &Where(const std::string &expression);
  /// Adds `column` = `value`, joined with AND. Ignored when `column` is empty; an empty `value`
  /// compares with the empty text.
  Condition &Where(const std::string &column, const std::string &value);

  /// Adds an SQL expression, joined with OR. Ignored when empty.
  Condition &OrWhere(const std::string &expression);
  /// The same as Where() with these arguments: it joins with AND. Callers rely on it; use the
  /// expression form for OR.
  Condition &OrWhere(const std::string &column, const std::string &value);

  /// Orders by `column`, after the orders added before.
  Condition &OrderBy(const std::string &column, bool desc);

  /// Rows to skip and rows to give; 0 or less leaves the clause out. An offset without a limit
  /// makes the query fail.
  Condition &Limit(int offset, int limit);
  /// The `page`-th page of `size` rows, counted from 1.
  Condition &Page(int page, int size);

  Condition &Clear();  ///< Back to no filter, no order, no page.

  bool IsEmpty();  ///< Whether nothing was set since the start or the last Clear().

  /// The SQL text, with a blank at its start; "" when there is nothing to say.
  std::string GetSQL() const;

 private:
  std::unique_ptr<ConditionPrivate> private_;
};

/// The sharing database: the file SZF_SHARING_DB_PATH, brought to the schema that this library
/// knows by the scripts that are installed beside it.
class VELK_EXPORT SharingDB : public BaseDB {
 public:
  /// The one instance of the process, opened and migrated by the first call (safe from several
  /// threads at once) and closed when the process exits.
  static SharingDB &Instance();

  SharingDB();
  ~SharingDB() override;

  /// Whether the connection is good and the schema is up to date. Fixed after construction.
  bool IsGood() const;

 private:
  std::unique_ptr<SharingDBPrivate> private_;
};

}  // namespace db
}  // namespace sharing
}  // namespace VELK

#endif
