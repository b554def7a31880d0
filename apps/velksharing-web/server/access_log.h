#ifndef VELKSHARING_WEB_SERVER_ACCESS_LOG_H
#define VELKSHARING_WEB_SERVER_ACCESS_LOG_H

#include <chrono>
#include <cstdint>
#include <mutex>
#include <optional>
#include <string>

#include "http/unique_fd.h"
#include "site/site.h"

namespace web {

/// A request that is over.
struct Visit {
  std::chrono::system_clock::time_point began = std::chrono::system_clock::now();
  std::chrono::steady_clock::time_point clock = std::chrono::steady_clock::now();  ///< As `began`.
  std::chrono::steady_clock::time_point head = clock;              ///< When its head was there.
  std::optional<std::chrono::steady_clock::duration> answer_time;  ///< From there to the answer.
  std::string address;                                             ///< The visitor's.
  std::string method;                                              ///< As sent.
  AccessNote note;
  int status = 0;
  uint64_t bytes = 0;    ///< Of the body, as announced or made.
  bool is_whole = true;  ///< false: the connection broke before the end.

  /// To be called as soon as the answer is made.
  void MarkAnswered() { answer_time = std::chrono::steady_clock::now() - head; }
};

/// One line for each request, of words with one blank between:
///
///     2026-11-21T17:24:12.345Z 192.0.2.7 GET file aB3… 206 5242880 12.4 1 done
///
/// time (UTC) when the request began, address, method, what it was about (AccessNote::route), the
/// link's hash shortened, status, bytes of the body, milliseconds until the last byte was handed
/// over, code of the access API (0: not asked), and "done", or "cut" when the visitor did not get
/// it all. "-" stands for what is not known. Any thread may write.
class AccessLog {
 public:
  /// @param target "off", "stderr", "syslog" or the path of a file, which others may append to.
  explicit AccessLog(std::string target);

  /// Opens the file, or opens it anew after it was moved away; nothing else needs it. When that
  /// fails the file that was open stays in use.
  /// @param[out] error on failure: one line.
  bool Open(std::string &error);

  void Write(const Visit &visit);

 private:
  const std::string target_;
  std::mutex mutex_;
  UniqueFd file_;
};

/// The line for a visit that ends now, without the line end.
std::string AccessLine(const Visit &visit);

}  // namespace web

#endif
