#ifndef TESTS_PLATFORM_PLAIN_DATABASE_H
#define TESTS_PLATFORM_PLAIN_DATABASE_H

#include <string>
#include <vector>

struct sqlite3;

namespace velk_test {

/// What running a text of statements has come to.
struct Outcome {
  bool done = false;
  std::string error;                           ///< Of a failure.
  std::vector<std::string> columns;            ///< Of the last statement that has some.
  std::vector<std::vector<std::string>> rows;  ///< Of that statement; NULL as "".
};

/// A connection that runs every statement straight on SQLite, as it came, with the rules of
/// VELKDBExecute() for scripts: what the platform's connection is compared with.
class PlainDatabase {
 public:
  explicit PlainDatabase(const std::string &path);
  PlainDatabase(const PlainDatabase &) = delete;
  PlainDatabase &operator=(const PlainDatabase &) = delete;
  ~PlainDatabase();

  Outcome Run(const char *sql);
  bool InTransaction() const;

 private:
  bool RunFirst(const char *&sql, Outcome &outcome);

  sqlite3 *connection_ = nullptr;
};

}  // namespace velk_test

#endif
