#include "errors.h"

namespace webapi {

using operations::Failure;

Refusal::Refusal(ErrorCode code, const std::string &message)
    : std::runtime_error(message), code_(code) {}

ErrorCode CodeOf(const Failure &failure) {
  switch (failure.kind()) {
    case Failure::NOT_FOUND:
      return NOT_FOUND;
    case Failure::REFUSED:
    case Failure::INVALID:
      return REFUSED;
    case Failure::DATABASE:
      return DATABASE_UNUSABLE;
    case Failure::SYSTEM:
      return SYSTEM_FAILED;
  }
  return SYSTEM_FAILED;
}

}  // namespace webapi
