#include "statement_cache.h"

#include <sqlite3.h>

#include <algorithm>
#include <functional>

namespace velkdb {
namespace {

constexpr size_t kCapacity = 64;

}  // namespace

Statement *StatementCache::Get(sqlite3 *connection, Durability &durability,
                               const std::string &text) {
  const size_t hash = std::hash<std::string>()(text);
  if (MoveToFront(hash, text)) return &entries_.front().statement;

  Statement statement;
  const char *rest = nullptr;
  if (Prepare(connection, durability, text.c_str(), Use::kOften, statement, rest) != SQLITE_OK)
    return nullptr;
  entries_.push_front({hash, text, std::move(statement)});
  if (entries_.size() > kCapacity) entries_.pop_back();
  return &entries_.front().statement;
}

void StatementCache::Clear() {
  entries_.clear();
}

bool StatementCache::MoveToFront(size_t hash, const std::string &text) {
  const auto found = std::find_if(entries_.begin(), entries_.end(), [&](const Entry &entry) {
    return entry.hash == hash && entry.text == text;
  });
  if (found == entries_.end()) return false;
  entries_.splice(entries_.begin(), entries_, found);
  return true;
}

}  // namespace velkdb
