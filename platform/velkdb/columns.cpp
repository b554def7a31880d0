#include "columns.h"

#include <sqlite3.h>

#include <algorithm>
#include <new>

namespace velkdb {
namespace {

bool SameName(const std::string &a, const char *b) {
  return sqlite3_stricmp(a.c_str(), b) == 0;
}

}  // namespace

Columns::Columns(sqlite3_stmt *statement)
    : count_(static_cast<size_t>(sqlite3_column_count(statement))) {
  for (size_t place = 0; place < count_; ++place) {
    const char *name = sqlite3_column_name(statement, static_cast<int>(place));
    if (name == nullptr) throw std::bad_alloc();
    const bool known = std::any_of(columns_.begin(), columns_.end(), [name](const Column &other) {
      return SameName(other.name, name);
    });
    if (!known) columns_.push_back({name, place});
  }
}

bool Columns::Find(const char *name, size_t &place, size_t &likely) const {
  for (size_t step = 0; step < columns_.size(); ++step) {
    const size_t candidate = (likely + step) % columns_.size();
    if (!SameName(columns_[candidate].name, name)) continue;
    place = columns_[candidate].place;
    likely = candidate + 1;
    return true;
  }
  return false;
}

}  // namespace velkdb
