#include "support/log_capture.h"

#include <syslog.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>

namespace velk_test {
namespace {

LogCapture *current = nullptr;

std::string Render(const char *format, va_list arguments) {
  va_list again;
  va_copy(again, arguments);
  const int length = vsnprintf(nullptr, 0, format, again);
  va_end(again);
  std::string text(length < 0 ? 0 : static_cast<size_t>(length), '\0');
  vsnprintf(text.data(), text.size() + 1, format, arguments);
  return text;
}

void Record(int priority, const char *format, va_list arguments) {
  if (current != nullptr) current->Add({priority, format, Render(format, arguments)});
}

}  // namespace

LogCapture::LogCapture() {
  current = this;
}
LogCapture::~LogCapture() {
  current = nullptr;
}

std::vector<std::string> LogCapture::Texts() const {
  std::vector<std::string> texts;
  for (const LogLine &line : lines_) texts.push_back(line.text);
  return texts;
}

}  // namespace velk_test

extern "C" __attribute__((visibility("default"))) void syslog(int priority, const char *format,
                                                              ...) {
  const int saved_errno = errno;  // what %m shows
  va_list arguments;
  va_start(arguments, format);
  errno = saved_errno;
  velk_test::Record(priority, format, arguments);
  va_end(arguments);
  errno = saved_errno;
}
