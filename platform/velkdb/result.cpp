#include "result.h"

#include <sqlite3.h>

#include <algorithm>

#include "velk/velkdb.h"

namespace {

bool SameName(const std::string &a, const char *b) {
  return sqlite3_stricmp(a.c_str(), b) == 0;
}

}  // namespace

DBResult_tag::DBResult_tag(const std::vector<std::string> &column_names)
    : width_(column_names.size()) {
  for (size_t index = 0; index < width_; ++index) {
    const std::string &name = column_names[index];
    const bool known = std::any_of(columns_.begin(), columns_.end(), [&name](const Column &other) {
      return SameName(other.name, name.c_str());
    });
    if (!known) columns_.push_back({name, index});
  }
}

void DBResult_tag::Append(std::string_view value) {
  offsets_.push_back(texts_.size());
  texts_.append(value);
  texts_.push_back('\0');
}

bool DBResult_tag::NextRow(unsigned int &row) {
  if (next_row_ >= RowCount()) return false;
  row = next_row_++;
  return true;
}

const char *DBResult_tag::Text(unsigned int row, const char *column) {
  if (row >= RowCount()) return "";
  const Column *found = FindColumn(column);
  return found == nullptr ? "" : texts_.data() + offsets_[row * width_ + found->index];
}

/// Readers ask for the columns in the order in which they stand, so the first look mostly hits.
const DBResult_tag::Column *DBResult_tag::FindColumn(const char *name) {
  const size_t count = columns_.size();
  for (size_t step = 0; step < count; ++step) {
    const size_t candidate = (likely_column_ + step) % count;
    if (!SameName(columns_[candidate].name, name)) continue;
    likely_column_ = (candidate + 1) % count;
    return &columns_[candidate];
  }
  return nullptr;
}

int VELKDBFetchRow(DBResult *result, unsigned int *row) {
  if (result == nullptr || row == nullptr) return -1;
  return result->NextRow(*row) ? 0 : -1;
}

const char *VELKDBFetchField(DBResult *result, unsigned int row, const char *column) {
  if (result == nullptr || column == nullptr) return "";
  return result->Text(row, column);
}

void VELKDBFreeResult(DBResult *result) {
  delete result;
}
