#include "time_input.h"

#include <time.h>

#include <charconv>
#include <optional>

#include "operations/failure.h"

namespace command_line {
namespace {

using operations::Failure;

constexpr long kLastMoment = 253402300799;  // 9999-12-31T23:59:59Z

std::optional<long> ParseNumber(const std::string &text) {
  long number = 0;
  const char *end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, number);
  const bool whole = !text.empty() && text[0] != '-' && error == std::errc() && rest == end;
  return whole ? std::optional(number) : std::nullopt;
}

long SecondsOf(char unit) {
  switch (unit) {
    case 's':
      return 1;
    case 'm':
      return 60;
    case 'h':
      return 3600;
    case 'd':
      return 86400;
    case 'w':
      return 7 * 86400;
  }
  return 0;
}

/// "7d"
std::optional<long> ParseSpan(const std::string &text) {
  if (text.empty()) return std::nullopt;
  const long unit = SecondsOf(text.back());
  const std::optional<long> count = ParseNumber(text.substr(0, text.size() - 1));
  if (unit == 0 || !count || *count == 0 || *count > kLastMoment / unit) return std::nullopt;
  return *count * unit;
}

/// Reads the clock's face of a text and gives what stands behind it, or null.
const char *ReadClock(const std::string &text, struct tm &clock) {
  for (const char *format :
       {"%Y-%m-%d %H:%M:%S", "%Y-%m-%dT%H:%M:%S", "%Y-%m-%d %H:%M", "%Y-%m-%dT%H:%M"}) {
    clock = {};
    const char *rest = strptime(text.c_str(), format, &clock);
    if (rest != nullptr && *rest != ':') return rest;
  }
  return nullptr;
}

bool SameClock(const struct tm &a, const struct tm &b) {
  return a.tm_year == b.tm_year && a.tm_mon == b.tm_mon && a.tm_mday == b.tm_mday &&
         a.tm_hour == b.tm_hour && a.tm_min == b.tm_min && a.tm_sec == b.tm_sec;
}

std::optional<long> FromLocalClock(const struct tm &clock) {
  struct tm parts = clock;
  parts.tm_isdst = -1;
  const time_t moment = mktime(&parts);
  return SameClock(parts, clock) ? std::optional<long>(moment) : std::nullopt;
}

/// "+02:00" in seconds.
std::optional<long> ParseOffset(const std::string &text) {
  if (text == "Z" || text == "z") return 0;
  if (text.size() != 6 || (text[0] != '+' && text[0] != '-') || text[3] != ':') return std::nullopt;
  const std::optional<long> hours = ParseNumber(text.substr(1, 2));
  const std::optional<long> minutes = ParseNumber(text.substr(4, 2));
  if (!hours || !minutes || *hours > 23 || *minutes > 59) return std::nullopt;
  return (text[0] == '-' ? -1 : 1) * (*hours * 3600 + *minutes * 60);
}

std::optional<long> FromClockWithOffset(const struct tm &clock, const std::string &offset_text) {
  const std::optional<long> offset = ParseOffset(offset_text);
  struct tm parts = clock;
  const time_t moment = timegm(&parts);
  if (!offset || !SameClock(parts, clock)) return std::nullopt;
  return moment - *offset;
}

std::optional<long> ParseClock(const std::string &text) {
  struct tm clock = {};
  const char *rest = ReadClock(text, clock);
  if (rest == nullptr) return std::nullopt;
  return *rest == '\0' ? FromLocalClock(clock) : FromClockWithOffset(clock, rest);
}

std::optional<long> Parse(const std::string &text, long now) {
  if (text.empty()) return std::nullopt;
  if (text[0] == '@') return ParseNumber(text.substr(1));
  if (text[0] != '+') return ParseClock(text);
  const std::optional<long> span = ParseSpan(text.substr(1));
  return span ? std::optional(now + *span) : std::nullopt;
}

}  // namespace

long ParseMoment(const std::string &text, long now) {
  const std::optional<long> moment = Parse(text, now);
  if (moment && *moment > 0 && *moment <= kLastMoment) return *moment;
  throw Failure(Failure::INVALID,
                "“" + text +
                    "” is not a time; write it as \"2026-12-31 18:00\", 2026-12-31T18:00:00Z, "
                    "@1798740000 or +7d");
}

long ParseLimit(const std::string &text, long now) {
  return text == "never" ? 0 : ParseMoment(text, now);
}

long ParseDuration(const std::string &text) {
  const std::optional<long> span = ParseSpan(text.substr(text.starts_with('+') ? 1 : 0));
  if (span) return *span;
  throw Failure(Failure::INVALID, "“" + text + "” is not a duration; write it as 30m, 2h or 7d");
}

}  // namespace command_line
