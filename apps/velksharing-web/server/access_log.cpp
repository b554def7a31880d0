#include "server/access_log.h"

#include <fcntl.h>
#include <syslog.h>

#include <cerrno>
#include <cstdio>
#include <ctime>
#include <system_error>

#include "server/printable.h"

namespace web {
namespace {

constexpr size_t kLongestMethod = 16;

std::string Time(std::chrono::system_clock::time_point moment) {
  using std::chrono::milliseconds;
  const auto since = std::chrono::duration_cast<milliseconds>(moment.time_since_epoch());
  const time_t seconds = since.count() / 1000;
  tm parts = {};
  gmtime_r(&seconds, &parts);
  char day[32] = "";
  strftime(day, sizeof(day), "%Y-%m-%dT%H:%M:%S", &parts);
  char text[48] = "";
  snprintf(text, sizeof(text), "%s.%03dZ", day, static_cast<int>(since.count() % 1000));
  return text;
}

std::string Milliseconds(std::chrono::steady_clock::duration spent) {
  char text[32] = "";
  snprintf(text, sizeof(text), "%.1f", std::chrono::duration<double, std::milli>(spent).count());
  return text;
}

/// A shortened hash: the mark of the cut is the only thing that is not ASCII.
std::string Shortened(std::string_view link) {
  constexpr std::string_view kCut = "…";
  if (!link.ends_with(kCut)) return Printable(link);
  link.remove_suffix(kCut.size());
  return (link.empty() ? "" : Printable(link)) + std::string(kCut);
}

void WriteWhole(int fd, std::string_view text) {
  // In one piece, or lines of several processes would mix. A full disk loses the line.
  while (write(fd, text.data(), text.size()) < 0 && errno == EINTR) {
  }
}

}  // namespace

AccessLog::AccessLog(std::string target) : target_(std::move(target)) {}

bool AccessLog::Open(std::string &error) {
  if (target_.front() != '/') return true;
  UniqueFd opened(
      open(target_.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC | O_NOCTTY, 0640));
  if (!opened.IsOpen()) {
    error = "access log " + target_ + ": " + std::generic_category().message(errno);
    return false;
  }
  const std::lock_guard guard(mutex_);
  file_ = std::move(opened);
  return true;
}

void AccessLog::Write(const Visit &visit) {
  if (target_ == "off") return;
  const std::string line = AccessLine(visit);
  if (target_ == "syslog") {
    syslog(LOG_INFO, "%s", line.c_str());
    return;
  }
  const std::lock_guard guard(mutex_);
  WriteWhole(target_ == "stderr" ? STDERR_FILENO : file_.get(), line + "\n");
}

std::string AccessLine(const Visit &visit) {
  std::string line = Time(visit.began);
  const auto add = [&line](const std::string &word) { line.append(" ").append(word); };
  add(Printable(visit.address));
  add(Printable(visit.method, kLongestMethod));
  add(Printable(visit.note.route));
  add(Shortened(visit.note.link));
  add(visit.status == 0 ? "-" : std::to_string(visit.status));
  add(std::to_string(visit.bytes));
  add(Milliseconds(std::chrono::steady_clock::now() - visit.clock));
  add(std::to_string(visit.note.code));
  add(visit.is_whole ? "done" : "cut");
  return line;
}

}  // namespace web
