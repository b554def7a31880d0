#ifndef VELKSHARING_INTERNAL_PLATFORM_PTR_H
#define VELKSHARING_INTERNAL_PLATFORM_PTR_H

#include <memory>

#include "velk/velkcgi.h"
#include "velk/velkdb.h"
#include "velk/velksdk.h"

/// Owners of what the platform hands out, freed by the platform's own calls.

namespace VELK::sharing::internal {

template <auto Free>
struct PlatformDeleter {
  template <typename T>
  void operator()(T *object) const {
    Free(object);
  }
};

using DatabasePtr = std::unique_ptr<VELKDBHandle, PlatformDeleter<VELKDBClose>>;
using UserPtr = std::unique_ptr<VELKUSER, PlatformDeleter<VELKUserFree>>;
using GroupPtr = std::unique_ptr<VELKGROUP, PlatformDeleter<VELKGroupFree>>;
using TextListPtr = std::unique_ptr<VLIBCSzHash, PlatformDeleter<VLIBCSzHashFree>>;
using CgiPtr = std::unique_ptr<VelkCgi, PlatformDeleter<VelkCgiFree>>;

}  // namespace VELK::sharing::internal

#endif
