#ifndef VELKSHARING_INTERNAL_LOG_H
#define VELKSHARING_INTERNAL_LOG_H

#include <syslog.h>
#include <unistd.h>

/// The library's messages in the system log. Each spells its whole format out, prefix and newlines
/// included, because these differ from layer to layer and log readers match them to the letter.

namespace VELK::sharing::internal {

/// The place that a message names: a source's name and the line of the call, or a given line where
/// that is part of the message.
struct Origin {
  Origin(const char *source_name, int at_line = __builtin_LINE())
      : source(source_name), line(at_line) {}

  const char *source;
  int line;
};

/// Logs a message whose format begins "%s:%d (%u) ": source, line, process id.
template <typename... Arguments>
void LogError(Origin origin, const char *format, Arguments... arguments) {
  syslog(LOG_ERR, format, origin.source, origin.line, static_cast<unsigned int>(getpid()),
         arguments...);
}

/// Logs a message whose format begins "%s:%d ": source, line.
template <typename... Arguments>
void LogErrorWithoutPid(Origin origin, const char *format, Arguments... arguments) {
  syslog(LOG_ERR, format, origin.source, origin.line, arguments...);
}

/// Logs that `condition`, given by its source text, held although it must not.
inline void LogFailedCondition(Origin origin, const char *condition) {
  LogError(origin, "%s:%d (%u) Failed [%s], err=%m\n\n", condition);
}

}  // namespace VELK::sharing::internal

/// Logs `condition` by its own text and returns false when it holds. `origin` is a source's name
/// or an Origin.
#define VELK_REFUSE_IF(origin, condition)                                \
  do {                                                                   \
    if (condition) {                                                     \
      ::VELK::sharing::internal::LogFailedCondition(origin, #condition); \
      return false;                                                      \
    }                                                                    \
  } while (false)

#endif
