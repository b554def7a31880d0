#ifndef OPERATIONS_MOMENT_H
#define OPERATIONS_MOMENT_H

#include <string>

namespace operations {

/// The current time in seconds since the Unix epoch.
long Now();

/// A moment in local time as "2026-12-31 18:00:00"; "" for 0 and less, which mean not set.
std::string MomentText(long seconds);

}  // namespace operations

#endif
