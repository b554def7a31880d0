#include "result.h"

#include "velk/velkdb.h"

namespace {

constexpr size_t kUsualText = 32;  // bytes of one value

}  // namespace

DBResult_tag::DBResult_tag(std::shared_ptr<const velkdb::Columns> columns)
    : columns_(std::move(columns)) {
  // Most results have one row.
  offsets_.reserve(columns_->count());
  texts_.reserve(columns_->count() * kUsualText);
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
  size_t place = 0;
  if (row >= RowCount() || !columns_->Find(column, place, likely_column_)) return "";
  return texts_.data() + offsets_[row * columns_->count() + place];
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
