#ifndef AUDIT_DATABASE_H
#define AUDIT_DATABASE_H

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>

struct sqlite3;
struct sqlite3_stmt;

/// SQLite as the audit trail needs it. Texts go in and out as bound values only.

namespace audit {

/// A statement failed, or the file cannot be opened. The message has no contents of the file.
class DatabaseError : public std::runtime_error {
 public:
  DatabaseError(const std::string &message, int code) : std::runtime_error(message), code_(code) {}

  /// Others hold the file at the moment.
  bool IsBusy() const;
  /// The file is not there.
  bool IsMissing() const;

 private:
  int code_;  ///< SQLite's.
};

/// One connection; for one thread at a time, not across fork(). Symbolic links are not followed.
class Database {
 public:
  enum class Use {
    READ,  ///< The file must be there.
    WRITE  ///< The file is made where it is missing, for the process's own account alone.
  };

  /// @param patience milliseconds that a statement waits for others.
  /// @throws DatabaseError.
  Database(const std::string &path, Use use, int patience);
  Database(const Database &) = delete;
  Database &operator=(const Database &) = delete;
  ~Database();

  /// Runs statements that have no values.
  void Run(const char *sql);
  /// The number in the first column of the first row; 0 without a row.
  int64_t Number(const char *sql);
  /// Whether another file lies at the path by now, or none.
  bool HasMoved();

  sqlite3 *connection() const { return connection_; }

 private:
  sqlite3 *connection_ = nullptr;
};

/// A compiled statement. Values and columns are counted as SQLite does: values from 1, columns
/// from 0. Every function throws DatabaseError.
class Statement {
 public:
  Statement(Database &database, const char *sql);
  Statement(const Statement &) = delete;
  Statement &operator=(const Statement &) = delete;
  ~Statement();

  Statement &Bind(int place, int64_t value);
  Statement &Bind(int place, const std::string &value);
  Statement &BindNull(int place);

  /// @return whether there is a row.
  bool Step();
  /// Runs it to its end, and makes it ready for other values.
  void Execute();

  int64_t Number(int column) const;
  bool IsNull(int column) const;
  std::string Text(int column) const;

 private:
  void Check(int outcome);

  sqlite3 *connection_;
  sqlite3_stmt *statement_ = nullptr;
};

}  // namespace audit

#endif
