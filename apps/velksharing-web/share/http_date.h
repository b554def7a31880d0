#ifndef VELKSHARING_WEB_SHARE_HTTP_DATE_H
#define VELKSHARING_WEB_SHARE_HTTP_DATE_H

#include <ctime>
#include <optional>
#include <string>

namespace web::share {

/// A date as header fields give it: "Sun, 06 Nov 1994 08:49:37 GMT".
std::string FormatHttpDate(time_t moment);

/// Reads a date in the form of today or in one of the two that HTTP had before.
std::optional<time_t> ParseHttpDate(const std::string &text);

}  // namespace web::share

#endif
