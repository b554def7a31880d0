#ifndef VELKSHARING_WEB_SITE_TRANSACTION_H
#define VELKSHARING_WEB_SITE_TRANSACTION_H

#include <optional>

#include "site/turn.h"

namespace web {

/// A transaction on the sharing database, which holds the write lock from its beginning: what is
/// read first and written then cannot have changed in between. Rolled back at the end of the scope
/// unless it is committed. They do not nest.
///
/// Everybody who writes waits for it. So nothing belongs into one that may take its time, such as
/// a question to a directory of accounts.
class Transaction {
 public:
  /// Waits its turn, and then for writers that take no turns: ten seconds each at most.
  Transaction();
  Transaction(const Transaction &) = delete;
  Transaction &operator=(const Transaction &) = delete;
  ~Transaction();

  /// False where none could be begun, and after Commit().
  bool IsOpen() const { return is_open_; }
  /// @return false when it failed, with nothing done, and when there was nothing to commit.
  bool Commit();

 private:
  std::optional<Turn> turn_{std::in_place};
  bool is_open_ = false;
};

}  // namespace web

#endif
