#include "site/transaction.h"

#include <velksharing/database.h>

namespace web {

using VELK::sharing::db::SharingDB;

Transaction::Transaction() {
  SharingDB &db = SharingDB::Instance();
  is_open_ = db.IsGood() && db.Execute("BEGIN IMMEDIATE");
}

Transaction::~Transaction() {
  if (is_open_) SharingDB::Instance().Execute("ROLLBACK");
}

bool Transaction::Commit() {
  if (!is_open_) return false;
  is_open_ = false;
  const bool is_committed = SharingDB::Instance().Commit();
  turn_.reset();
  return is_committed;
}

}  // namespace web
