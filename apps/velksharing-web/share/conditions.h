#ifndef VELKSHARING_WEB_SHARE_CONDITIONS_H
#define VELKSHARING_WEB_SHARE_CONDITIONS_H

#include <ctime>
#include <string>

#include "http/fields.h"
#include "share/item.h"

namespace web::share {

/// What tells one state of a file from another.
struct Validators {
  std::string tag;      ///< Strong, with its quotes.
  time_t modified = 0;  ///< Seconds since the Unix epoch.
};

Validators ValidatorsOf(const Item &file);

/// What the conditions of a request say about the file that it asks for.
enum class Verdict {
  SEND,          ///< 200 or 206
  NOT_MODIFIED,  ///< 304: the visitor has it.
  FAILED,        ///< 412: it is not the state that the visitor means.
};

/// Weighs If-Match, If-Unmodified-Since, If-None-Match and If-Modified-Since in HTTP's order.
Verdict Weigh(const Fields &request, const Validators &file);

/// Whether If-Range, if there is one, lets a Range hold.
/// @param now seconds since the Unix epoch: a date does not tell changes of one second apart.
bool MayHoldRange(const Fields &request, const Validators &file, time_t now);

}  // namespace web::share

#endif
