#include <algorithm>
#include <system_error>

#include "velk/velkrandom.h"
#include "velksharing/utils.h"

namespace VELK::sharing {

bool IsProbabilityHit(float probability) {
  static RANDOM::VELKRandomBase source;
  try {
    const int draw = source.random(0, 99);
    if (!(probability > 0.0f)) return false;  // not a number included
    return draw < static_cast<int>(std::min(probability, 1.0f) * 100.0f);
  } catch (const std::system_error &) {  // no randomness: the work can wait for another call
    return false;
  }
}

}  // namespace VELK::sharing
