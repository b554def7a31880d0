#ifndef VELKSDK_SQLITE_H
#define VELKSDK_SQLITE_H

#include <sqlite3.h>

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>

namespace velk {

/// Why SQLite refused, in its words.
class SqliteError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// A connection to one SQLite file that exists. It must not cross a fork().
class Connection {
 public:
  /// Opens `path`, which must hold no symlink in any of its parts. Throws SqliteError.
  explicit Connection(const std::string &path);

  /// Runs all statements of `sql`. Throws SqliteError.
  void Run(const char *sql);
  /// Rows that the last statement inserted, changed or deleted.
  int64_t Changes() const;

  sqlite3 *get() const { return connection_.get(); }

 private:
  struct Close {
    void operator()(sqlite3 *connection) const { sqlite3_close(connection); }
  };
  std::unique_ptr<sqlite3, Close> connection_;
};

/// One statement. Parameters are bound by their name, colon included.
class Statement {
 public:
  Statement(const Connection &connection, const char *sql);

  Statement &Bind(const char *parameter, int64_t value);
  Statement &Bind(const char *parameter, const std::string &value);

  /// Goes to the next row; false when there is none.
  bool Step();

  int64_t Number(int column) const;
  std::string Text(int column) const;
  bool IsNull(int column) const;

 private:
  struct Finalize {
    void operator()(sqlite3_stmt *statement) const { sqlite3_finalize(statement); }
  };
  int Index(const char *parameter) const;

  sqlite3 *connection_;
  std::unique_ptr<sqlite3_stmt, Finalize> statement_;
};

/// A transaction that may write, from its construction to Commit(); rolled back without.
class Transaction {
 public:
  explicit Transaction(Connection &connection);
  Transaction(const Transaction &) = delete;
  Transaction &operator=(const Transaction &) = delete;
  ~Transaction();

  void Commit();

 private:
  Connection &connection_;
  bool open_ = true;
};

}  // namespace velk

#endif
