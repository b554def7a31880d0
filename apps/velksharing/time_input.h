#ifndef VELKSHARING_CLI_TIME_INPUT_H
#define VELKSHARING_CLI_TIME_INPUT_H

#include <string>

/// Times as people type them. Failures are Failure INVALID, naming the forms that are understood.

namespace command_line {

/// A moment in seconds since the Unix epoch, from
///   "2026-12-31 18:00", "2026-12-31 18:00:05"   local time ("T" may stand for the blank)
///   "2026-12-31T18:00:05Z", "…+02:00"           RFC 3339
///   "@1798740000"                               the number itself
///   "+30m", "+2h", "+7d", "+1w", "+45s"         from `now`
/// A local time that a change of the clocks skips is refused.
/// @return more than 0, up to the end of the year 9999.
long ParseMoment(const std::string &text, long now);

/// As ParseMoment(), and "never" as 0.
long ParseLimit(const std::string &text, long now);

/// A duration of at least a second, in seconds: "30m", "7d", also with "+" before it.
long ParseDuration(const std::string &text);

}  // namespace command_line

#endif
