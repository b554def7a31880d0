#include "operations/failure.h"

#include <cerrno>
#include <system_error>

namespace operations {

Failure::Failure(Kind kind, const std::string &message)
    : std::runtime_error(message), kind_(kind) {}

Failure SystemFailure(const std::string &what) {
  return Failure(Failure::SYSTEM, what + ": " + std::generic_category().message(errno));
}

}  // namespace operations
