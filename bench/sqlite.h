#ifndef BENCH_SQLITE_H
#define BENCH_SQLITE_H

#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

/// SQLite with nothing between but what a careful program needs: set up as the library sets it up,
/// statements prepared once, values bound. Every failure throws SqliteError.
///
///     Connection connection(path);
///     Statement find(connection, "SELECT * FROM token WHERE id = ?");
///     const Statement::Scope scope(find.Bind(1, 17));
///     if (find.NextRow()) return find.Number(3);

namespace velk_bench {

class SqliteError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// When a change is on the disk.
enum class Commit {
  kRelaxed,  ///< Some time later.
  kFlushed,  ///< Before the statement returns.
};

/// One connection to an existing file.
class Connection {
 public:
  /// WAL is the file's own setting; the connection runs it with synchronous=NORMAL, a cache of 5000
  /// pages, foreign keys checked, and waits 10 seconds for other processes in short sleeps.
  explicit Connection(const std::string &path);
  Connection(const Connection &) = delete;
  Connection &operator=(const Connection &) = delete;
  ~Connection();

  /// Runs all statements of `sql`, each kRelaxed.
  void Run(const char *sql);

  std::int64_t LastInsertId() const;

  /// How the statements that run from now on commit.
  void Use(Commit commit) { commit_ = commit; }

  sqlite3 *handle() const { return handle_; }

 private:
  static int OnCommit(void *connection, sqlite3 *handle, const char *database, int frames);

  sqlite3 *handle_ = nullptr;
  Commit commit_ = Commit::kRelaxed;
};

/// One prepared statement, to be run any number of times. Must not outlive its connection.
class Statement {
 public:
  Statement(Connection &connection, const char *sql, Commit commit = Commit::kRelaxed);
  Statement(const Statement &) = delete;
  Statement &operator=(const Statement &) = delete;
  ~Statement();

  /// Ends the reading of rows, and with it the read lock.
  class Scope {
   public:
    explicit Scope(Statement &statement) : statement_(statement) {}
    Scope(const Scope &) = delete;
    Scope &operator=(const Scope &) = delete;
    ~Scope() { statement_.Reset(); }

   private:
    Statement &statement_;
  };

  /// Places count from 1. A text must stay as it is until the statement has run.
  Statement &Bind(int place, std::int64_t number);
  Statement &Bind(int place, std::string_view text);

  /// Runs a statement that yields no rows, and makes it ready for the next run.
  void Run();

  /// Moves to the next row; false when there is none.
  bool NextRow();

  int ColumnCount() const;
  /// Columns count from 0. A text is valid until the next call of NextRow() or Reset().
  std::int64_t Number(int column) const;
  std::string_view Text(int column) const;

  void Reset();

 private:
  Connection &connection_;
  const Commit commit_;
  sqlite3_stmt *handle_ = nullptr;
};

}  // namespace velk_bench

#endif
