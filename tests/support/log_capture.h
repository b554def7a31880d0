#ifndef TESTS_SUPPORT_LOG_CAPTURE_H
#define TESTS_SUPPORT_LOG_CAPTURE_H

#include <string>
#include <vector>

namespace velk_test {

/// One call of syslog().
struct LogLine {
  int priority;        ///< As given: level and facility.
  std::string format;  ///< As given.
  std::string text;    ///< The format filled in, `%m` included.
};

/// Collects what this process sends to syslog() while it lives, instead of sending it. A program
/// that uses this class replaces syslog() for every library that it loads. One at a time.
class LogCapture {
 public:
  LogCapture();
  LogCapture(const LogCapture &) = delete;
  LogCapture &operator=(const LogCapture &) = delete;
  ~LogCapture();

  const std::vector<LogLine> &lines() const { return lines_; }
  /// The texts of all lines, in order.
  std::vector<std::string> Texts() const;
  void Clear() { lines_.clear(); }
  void Add(LogLine line) { lines_.push_back(std::move(line)); }

 private:
  std::vector<LogLine> lines_;
};

}  // namespace velk_test

#endif
