#ifndef TESTS_SUPPORT_RAW_DATABASE_H
#define TESTS_SUPPORT_RAW_DATABASE_H

#include <string>
#include <vector>

struct sqlite3;

namespace velk_test {

/// A database file seen straight through SQLite, beside the code under test. Every failure throws.
class RawDatabase {
 public:
  /// Opens `path` and creates it when it is missing.
  explicit RawDatabase(const std::string &path);
  RawDatabase(const RawDatabase &) = delete;
  RawDatabase &operator=(const RawDatabase &) = delete;
  ~RawDatabase();

  /// Runs all statements of `sql`.
  void Run(const std::string &sql);
  /// The rows of one statement: each a list of texts, NULL as "NULL".
  std::vector<std::vector<std::string>> Rows(const std::string &sql);
  /// The first column of the first row; "" when there is none.
  std::string Value(const std::string &sql);

 private:
  sqlite3 *connection_ = nullptr;
};

/// Makes a new sharing database of the newest schema version at `path` from the schema scripts.
void MakeSharingDatabase(const std::string &path);

}  // namespace velk_test

#endif
