#ifndef VELKDB_CONNECTION_H
#define VELKDB_CONNECTION_H

#include <memory>
#include <string>

#include "busy_wait.h"
#include "durability.h"
#include "literals.h"
#include "statement_cache.h"

struct sqlite3;

namespace velkdb {

struct ConnectionDeleter {
  void operator()(sqlite3 *connection) const;
};

}  // namespace velkdb

/// One connection with what it needs around it.
struct VELKDBHandle_tag {
  velkdb::BusyWait busy_wait;
  velkdb::Durability durability;
  std::string error;  ///< The text of the last failure.
  /// Closed before those above: SQLite calls the first two until then.
  std::unique_ptr<sqlite3, velkdb::ConnectionDeleter> sqlite;
  velkdb::StatementCache statements;  ///< Of the connection, so it goes before it does.
  velkdb::LiftedText lifted;          ///< Of the statement being run; kept for its memory.
};

#endif
