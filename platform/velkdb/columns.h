#ifndef VELKDB_COLUMNS_H
#define VELKDB_COLUMNS_H

#include <cstddef>
#include <string>
#include <vector>

struct sqlite3_stmt;

namespace velkdb {

/// The names of a statement's columns.
class Columns {
 public:
  /// Names are known from the first step on: that may compile the statement anew.
  explicit Columns(sqlite3_stmt *statement);

  /// How many there are, those of equal names among them.
  size_t count() const { return count_; }

  /// Finds the first column of a name, upper and lower case alike.
  /// @param place receives where it stands in a row.
  /// @param likely which one to look at first; receives the one behind the found one, for readers
  ///        ask for the columns in the order in which they stand. 0 at the start.
  bool Find(const char *name, size_t &place, size_t &likely) const;

 private:
  struct Column {
    std::string name;
    size_t place;
  };

  size_t count_;
  std::vector<Column> columns_;  ///< Of equal names only the first.
};

}  // namespace velkdb

#endif
