#ifndef OPERATIONS_FAILURE_H
#define OPERATIONS_FAILURE_H

#include <stdexcept>
#include <string>

namespace operations {

/// Why an operation was not done; thrown by every operation of this folder.
///
/// The message is one sentence for an administrator, without a full stop. It never holds a
/// password or a session identifier, but may hold texts from outside: clean it before a terminal
/// shows it.
class Failure : public std::runtime_error {
 public:
  enum Kind {
    NOT_FOUND,  ///< What was named does not exist.
    REFUSED,    ///< It exists, but this cannot be done to it.
    INVALID,    ///< The request itself makes no sense.
    DATABASE,   ///< The database is unusable or a statement failed.
    SYSTEM      ///< Files, memory, the terminal.
  };

  Failure(Kind kind, const std::string &message);

  Kind kind() const { return kind_; }

 private:
  Kind kind_;
};

/// A Failure of kind SYSTEM whose message ends in the text of the current errno.
Failure SystemFailure(const std::string &what);

}  // namespace operations

#endif
