#ifndef VELK_VELKRANDOM_H
#define VELK_VELKRANDOM_H

#include <string>

#include "velk/export.h"

/// Random numbers and texts straight from the kernel's generator: cryptographically strong,
/// uniform, and failing rather than degrading. Every call may be made from any thread.

namespace VELK {
namespace RANDOM {

extern VELK_PLATFORM_API const char *const POOL_ALPHA_NUMERIC;  ///< 62 letters and digits.
extern VELK_PLATFORM_API const char *const POOL_URL_FRIENDLY;   ///< Those, '-' and '_'.

/// A source of random numbers. Holds no state.
class VELK_PLATFORM_API VELKRandomBase {
 public:
  VELKRandomBase();
  virtual ~VELKRandomBase();

  /// A whole number from `low` to `high`, both included, each equally likely.
  /// @throws std::invalid_argument when `low` > `high`;
  ///         std::system_error when the kernel gives no random bytes.
  int random(int low, int high);
};

/// A source of random texts.
class VELK_PLATFORM_API VELKRandom : public VELKRandomBase {
 public:
  VELKRandom();
  ~VELKRandom() override;

  /// Replaces `out` with `length` bytes drawn uniformly from those of `pool` (a byte that stands
  /// there twice is twice as likely). `pool` and `out` may be the same string.
  /// @return false, with `out` empty, when `pool` is empty, holds more than 256 bytes, or the
  ///         kernel gives no random bytes. Throws nothing but std::bad_alloc.
  bool getString(const std::string &pool, unsigned int length, std::string &out);
};

}  // namespace RANDOM
}  // namespace VELK

#endif
