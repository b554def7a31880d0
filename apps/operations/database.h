#ifndef OPERATIONS_DATABASE_H
#define OPERATIONS_DATABASE_H

#include <memory>
#include <string>

#include "operations/failure.h"
#include "velksharing/database.h"

namespace operations {

using VELK::sharing::db::BaseDB;
using VELK::sharing::db::SharingDB;

/// The sharing database of this process, made and brought up to date where needed.
/// @throws Failure DATABASE, telling where it is and why it cannot be used.
SharingDB &SharingDatabase();

/// A connection to the existing sharing database that can change nothing in it: a missing file is
/// not made, an old schema not brought up to date, and every writing statement fails. Changes that
/// others had committed to the log may still move into the file when the last connection closes.
/// @throws Failure DATABASE.
std::unique_ptr<BaseDB> OpenForReading();

/// What to throw when the sharing database cannot be opened: tells where it is and the likely
/// reason.
Failure DatabaseUnusable();

/// What to throw when `what` ("the link could not be stored") failed in the database: adds the
/// database's own reason.
Failure DatabaseFailure(const BaseDB &db, const std::string &what);

/// The number in column "n" of the first row that `sql` gives.
/// @throws Failure DATABASE when it fails or gives no row.
long ReadNumber(BaseDB &db, const std::string &sql);

/// How many rows the DELETE that this connection ran last has removed.
int RemovedRows(BaseDB &db);

/// What a removal did.
struct Removal {
  int removed = 0;    ///< Rows that are gone.
  int remaining = 0;  ///< Rows of the table that are left.
};

/// A page of a list.
struct Page {
  int offset = 0;  ///< Rows to skip.
  int limit = 50;  ///< Rows to give, at least 1.
};

/// One transaction, undone at the end of the scope unless Commit() was called.
class Transaction {
 public:
  enum Kind {
    SNAPSHOT,  ///< Every statement sees the database as it was at the first one.
    WRITE      ///< As SNAPSHOT, and nobody else writes in between.
  };

  Transaction(BaseDB &db, Kind kind);
  Transaction(const Transaction &) = delete;
  Transaction &operator=(const Transaction &) = delete;
  ~Transaction();

  void Commit();

 private:
  BaseDB &db_;
  bool open_ = true;
};

}  // namespace operations

#endif
