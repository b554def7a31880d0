#include "server/answer_head.h"

#include <microhttpd.h>
#include <syslog.h>

#include <algorithm>
#include <string_view>

#include "server/printable.h"

namespace web {
namespace {

constexpr int kNoContent = 204;
constexpr int kNotModified = 304;

bool EndsLine(char byte) {
  return byte == '\r' || byte == '\n' || byte == '\0';
}

bool IsOneLine(std::string_view text) {
  return std::none_of(text.begin(), text.end(), EndsLine);
}

}  // namespace

bool IsBodiless(int status) {
  return status == kNoContent || status == kNotModified;
}

bool HasBody(const Response &response, const std::string &method) {
  return method != "HEAD" && !IsBodiless(response.status);
}

std::optional<uint64_t> BodyLength(const Response &response) {
  if (const auto *text = std::get_if<std::string>(&response.body)) return text->size();
  if (const auto *file = std::get_if<FileBody>(&response.body))
    return static_cast<uint64_t>(file->length);
  return std::nullopt;
}

std::string CgiHead(const Response &response) {
  const char *reason = MHD_get_reason_phrase_for(static_cast<unsigned>(response.status));
  std::string head = "Status: " + std::to_string(response.status) + " " + reason + "\r\n";
  for (const auto &[name, value] : response.headers) {
    if (IsOneLine(name) && IsOneLine(value)) {
      head.append(name).append(": ").append(value).append("\r\n");
    } else {
      syslog(LOG_ERR, "left out of an answer: the broken field %s", Printable(name).c_str());
    }
  }
  const auto length = BodyLength(response);
  if (length && !IsBodiless(response.status))
    head += "Content-Length: " + std::to_string(*length) + "\r\n";
  return head + "\r\n";
}

}  // namespace web
