#ifndef VELKDB_RESULT_H
#define VELKDB_RESULT_H

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "columns.h"

/// The rows of one executed statement, copied out of SQLite.
///
/// All texts lie one after the other in one block, each with its terminating zero.
struct DBResult_tag {
 public:
  /// A result without rows.
  explicit DBResult_tag(std::shared_ptr<const velkdb::Columns> columns);

  /// Appends the next value of the row being filled; a row is complete with its last column.
  void Append(std::string_view value);
  /// The number of complete rows.
  size_t RowCount() const { return offsets_.size() / columns_->count(); }

  /// Moves on to the next row. @return false when no row is left.
  bool NextRow(unsigned int &row);
  /// The text of one value; "" for an unknown column or row.
  const char *Text(unsigned int row, const char *column);

 private:
  std::shared_ptr<const velkdb::Columns> columns_;  ///< At least one.
  std::string texts_;
  std::vector<size_t> offsets_;  ///< Into texts_, row after row.
  unsigned int next_row_ = 0;
  size_t likely_column_ = 0;
};

#endif
