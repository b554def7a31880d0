#ifndef VELKSHARING_WEB_SITE_TRANSACTION_H
#define VELKSHARING_WEB_SITE_TRANSACTION_H

#include <optional>

#include "site/turn.h"

namespace web {

/// A transaction on the sharing database, which holds the write lock from its beginning: what is
/// read first and written then cannot have changed in between. Rolled back at the end of the scope
/// unless it is committed. They do not nest.
class Transaction {
 public:
  /// Where none can be begun, what follows is not held together; whoever works on the database
  /// then meets the reason.
  Transaction();
  Transaction(const Transaction &) = delete;
  Transaction &operator=(const Transaction &) = delete;
  ~Transaction();

  /// @return false when it failed, with nothing done.
  bool Commit();

 private:
  std::optional<Turn> turn_{std::in_place};
  bool is_open_ = false;
};

}  // namespace web

#endif
