#ifndef VELKDB_BINDING_H
#define VELKDB_BINDING_H

#include <vector>

#include "literals.h"

struct sqlite3_stmt;

namespace velkdb {

/// Values bound to a statement, to be stepped in this scope; at its end the statement is reset and
/// holds no value any more.
class BindingScope {
 public:
  /// @param values refer to a text that outlives this.
  BindingScope(sqlite3_stmt *statement, const std::vector<Literal> &values);
  BindingScope(const BindingScope &) = delete;
  BindingScope &operator=(const BindingScope &) = delete;
  ~BindingScope();

  /// How the binding went, as an SQLite result code.
  int outcome() const { return outcome_; }

 private:
  sqlite3_stmt *const statement_;
  int outcome_;
};

}  // namespace velkdb

#endif
