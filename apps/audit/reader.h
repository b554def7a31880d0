#ifndef AUDIT_READER_H
#define AUDIT_READER_H

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "audit/record.h"

namespace audit {

class Database;

/// Which records of a link.
struct Query {
  int entry_id = 0;
  int64_t since = 0;     ///< Not before this moment, in microseconds since the Unix epoch.
  int64_t after_id = 0;  ///< Stored after the record with this id.
  int64_t limit = -1;    ///< The last ones, so many; -1 for all.
};

/// Reads an audit trail while others write it. Each call throws DatabaseError. For one thread at a
/// time.
class Reader {
 public:
  /// Opens the file, which must be there.
  explicit Reader(const std::string &path);
  Reader(const Reader &) = delete;
  Reader &operator=(const Reader &) = delete;
  ~Reader();

  /// Hands the records over, the oldest first.
  /// @return the largest id of the whole trail, for Query::after_id.
  int64_t Read(const Query &query, const std::function<void(const Record &)> &take);

  /// Whether another file lies at the path by now, or none.
  bool HasMoved();

 private:
  std::unique_ptr<Database> database_;
};

}  // namespace audit

#endif
