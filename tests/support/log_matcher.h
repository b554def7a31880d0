#ifndef TESTS_SUPPORT_LOG_MATCHER_H
#define TESTS_SUPPORT_LOG_MATCHER_H

#include <gmock/gmock.h>
#include <syslog.h>
#include <unistd.h>

#include <ostream>
#include <regex>
#include <string>

#include "support/log_capture.h"

namespace velk_test {

inline std::ostream &operator<<(std::ostream &out, const LogLine &line) {
  return out << "{" << line.priority << ", \"" << line.format << "\", \"" << line.text << "\"}";
}

/// A line's text without what changes from build to build and run to run: the source line becomes
/// "#", this process's id "@", and what stands for `%m` behind "err=" becomes "*".
inline std::string Shape(const LogLine &line) {
  static const std::regex source_line("^([a-z_/]+):[0-9]+ ");
  static const std::regex error_text("err=[^\n]+");
  std::string shape = std::regex_replace(line.text, source_line, "$1:# ");
  shape = std::regex_replace(shape, error_text, "err=*");
  const std::string process = "(" + std::to_string(getpid()) + ")";
  const size_t at = shape.find(process);
  return at == std::string::npos ? shape : shape.replace(at, process.size(), "(@)");
}

/// A line at LOG_ERR with this format whose text has this shape.
inline ::testing::Matcher<const LogLine &> ErrorLine(const std::string &format,
                                                     const std::string &shape) {
  return ::testing::AllOf(::testing::Field("priority", &LogLine::priority, LOG_ERR),
                          ::testing::Field("format", &LogLine::format, format),
                          ::testing::ResultOf("shape", Shape, shape));
}

/// The line of a failed internal condition, from whatever source line.
inline ::testing::Matcher<const LogLine &> FailedCondition(const std::string &source,
                                                           const std::string &condition) {
  return ErrorLine("%s:%d (%u) Failed [%s], err=%m\n\n",
                   source + ":# (@) Failed [" + condition + "], err=*\n\n");
}

/// The same, from exactly this source line.
inline ::testing::Matcher<const LogLine &> FailedConditionAt(const std::string &source, int line,
                                                             const std::string &condition) {
  return ::testing::AllOf(
      FailedCondition(source, condition),
      ::testing::Field("text", &LogLine::text,
                       ::testing::StartsWith(source + ":" + std::to_string(line) + " ")));
}

}  // namespace velk_test

#endif
