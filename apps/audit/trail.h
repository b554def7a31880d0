#ifndef AUDIT_TRAIL_H
#define AUDIT_TRAIL_H

#include "velk_paths.h"

namespace audit {

/// Where velksharing-web keeps the audit trail.
inline constexpr char kTrailPath[] = VELK_ROOT "/etc/private/session/sharing-audit.db";

/// The version of its tables (user_version); 0 is a file without any.
inline constexpr int kTrailVersion = 1;

}  // namespace audit

#endif
