#ifndef VELKSDK_AUTOBLOCK_LIMITS_H
#define VELKSDK_AUTOBLOCK_LIMITS_H

namespace velk {

/// When an address is blocked, and for how long.
struct AutoBlockLimits {
  long attempts = 10;  ///< Failures that block.
  long within = 300;   ///< Seconds from the first failure in which they count together.
  long block = 86400;  ///< Seconds that the block lasts; 0 = for ever.
};

/// Reads VELK_ROOT/etc/autoblock.conf. A missing file means the defaults; a file with a mistake is
/// logged and means the defaults for everything.
AutoBlockLimits ReadAutoBlockLimits();

}  // namespace velk

#endif
