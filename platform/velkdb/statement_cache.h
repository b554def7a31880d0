#ifndef VELKDB_STATEMENT_CACHE_H
#define VELKDB_STATEMENT_CACHE_H

#include <cstddef>
#include <list>
#include <string>

#include "statement.h"

namespace velkdb {

/// The statements of one connection that were used last, compiled, under their lifted texts.
class StatementCache {
 public:
  StatementCache() = default;
  StatementCache(const StatementCache &) = delete;
  StatementCache &operator=(const StatementCache &) = delete;

  /// The statement of `text`, compiled when it is not here yet. It is reset and unbound, and stays
  /// valid until the next call.
  /// @return null when it cannot be compiled.
  Statement *Get(sqlite3 *connection, Durability &durability, const std::string &text);

  /// Forgets all statements.
  void Clear();

 private:
  struct Entry {
    size_t hash;
    std::string text;
    Statement statement;
  };

  bool MoveToFront(size_t hash, const std::string &text);

  std::list<Entry> entries_;  ///< The last used one first.
};

}  // namespace velkdb

#endif
