#include "request.h"

#include <unistd.h>

#include <cerrno>
#include <charconv>
#include <cstdlib>
#include <cstring>

#include "secret.h"
#include "velk/velkcgi.h"

namespace velk {
namespace {

thread_local const VelkCgiRequest *handed_over = nullptr;

const char *Find(const char *const *environment, const char *name) {
  const size_t length = strlen(name);
  for (; environment != nullptr && *environment != nullptr; ++environment) {
    if (strncmp(*environment, name, length) == 0 && (*environment)[length] == '=') {
      return *environment + length + 1;
    }
  }
  return nullptr;
}

/// CONTENT_LENGTH where it is a number that we accept, else 0.
size_t AnnouncedLength() {
  const char *value = RequestVariable("CONTENT_LENGTH");
  if (value == nullptr) return 0;
  const std::string_view text = value;
  size_t length = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), length);
  if (error != std::errc() || end != text.data() + text.size()) return 0;
  return length <= kLargestBody ? length : 0;
}

bool IsPost() {
  const char *method = RequestVariable("REQUEST_METHOD");
  return method != nullptr && strcmp(method, "POST") == 0;
}

/// Reads exactly `length` bytes of standard input.
/// @return false at an earlier end or an error.
bool ReadInput(char *out, size_t length) {
  while (length > 0) {
    const ssize_t count = read(STDIN_FILENO, out, length);
    if (count == -1 && errno == EINTR) continue;
    if (count <= 0) return false;
    out += count;
    length -= static_cast<size_t>(count);
  }
  return true;
}

Secret ReadStandardBody() {
  Secret body(IsPost() ? AnnouncedLength() : 0);
  return ReadInput(body.data(), body.size()) ? std::move(body) : Secret(0);
}

/// Standard input can be read only once, and one CGI process serves one request.
std::string_view StandardBody() {
  static const Secret body = ReadStandardBody();
  return body.view();
}

}  // namespace

const char *RequestVariable(const char *name) {
  return handed_over == nullptr ? getenv(name) : Find(handed_over->environment, name);
}

std::string_view RequestBody() {
  if (handed_over == nullptr) return StandardBody();
  if (handed_over->body == nullptr || handed_over->body_length > kLargestBody) return {};
  return {handed_over->body, handed_over->body_length};
}

}  // namespace velk

void VelkCgiRequestBegin(const VelkCgiRequest *request) {
  velk::handed_over = request;
}

void VelkCgiRequestEnd(void) {
  velk::handed_over = nullptr;
}
