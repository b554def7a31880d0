#include "server/message_head.h"

#include <strings.h>

#include <algorithm>
#include <charconv>
#include <string>

#include "server/limits.h"

namespace web {
namespace {

constexpr int kBadRequest = 400;
constexpr int kLengthRequired = 411;
constexpr int kContentTooLarge = 413;
constexpr int kVersionNotSupported = 505;

constexpr std::string_view kOfConnection[] = {
    "Connection", "Expect",  "Keep-Alive",        "Proxy",   "Proxy-Connection",
    "TE",         "Trailer", "Transfer-Encoding", "Upgrade",
};

bool IsNameLetter(char letter) {
  return (letter >= 'a' && letter <= 'z') || (letter >= 'A' && letter <= 'Z') ||
         (letter >= '0' && letter <= '9') || letter == '-';
}

bool IsTokenLetter(char letter) {
  constexpr std::string_view kOthers = "!#$%&'*+.^_`|~";
  return IsNameLetter(letter) || kOthers.find(letter) != std::string_view::npos;
}

bool IsControl(char byte) {
  return (static_cast<unsigned char>(byte) < ' ' && byte != '\t') || byte == '\x7f';
}

bool IsWellFormed(const Fields::Field &field) {
  const auto &[name, value] = field;
  return !name.empty() && std::all_of(name.begin(), name.end(), IsTokenLetter) &&
         std::none_of(value.begin(), value.end(), IsControl);
}

bool IsOfConnection(const std::string &name) {
  return std::any_of(std::begin(kOfConnection), std::end(kOfConnection), [&](std::string_view one) {
    return name.size() == one.size() && strncasecmp(name.data(), one.data(), one.size()) == 0;
  });
}

Fields ForHandler(const Fields &fields) {
  Fields kept;
  for (const auto &[name, value] : fields) {
    if (std::all_of(name.begin(), name.end(), IsNameLetter) && !IsOfConnection(name))
      kept.Add(name, value);
  }
  return kept;
}

HeadVerdict JudgeLength(const Fields &fields) {
  const size_t lengths = fields.Count("Content-Length");
  if (fields.Count("Transfer-Encoding") > 0)
    return {lengths > 0 ? kBadRequest : kLengthRequired, 0};
  if (lengths == 0) return {};
  const std::string_view text = fields.Get("Content-Length");
  const char *end = text.data() + text.size();
  uint64_t length = 0;
  const auto [rest, error] = std::from_chars(text.data(), end, length);
  if (lengths > 1 || error != std::errc() || rest != end) return {kBadRequest, 0};
  return {length > kFormLimit ? kContentTooLarge : 0, length};
}

}  // namespace

bool IsAccountedFor(std::string_view head, std::string_view version,
                    const std::vector<RawField> &fields) {
  constexpr std::string_view kLineEnd("\0\0", 2);
  constexpr std::string_view kColon("\0", 1);
  constexpr std::string_view kBlanks = " \t";
  const char *const end = head.data() + head.size();
  const char *at = version.data() + version.size();
  const auto pass = [&](std::string_view expected) {
    const auto left = static_cast<size_t>(end - at);
    if (!std::string_view(at, left).starts_with(expected)) return false;
    at += expected.size();
    return true;
  };
  const auto pass_blanks = [&] {
    while (at < end && kBlanks.find(*at) != std::string_view::npos) ++at;
  };
  for (const auto &[name, value] : fields) {
    if (!pass(kLineEnd) || at != name.data()) return false;
    at += name.size();
    if (!pass(kColon)) return false;
    pass_blanks();
    if (at != value.data()) return false;
    at += value.size();
    pass_blanks();
  }
  return pass(kLineEnd) && pass(kLineEnd) && at == end;
}

HeadVerdict JudgeHead(Request &request, std::string_view version) {
  const Fields sent = std::move(request.headers);
  request.headers = ForHandler(sent);
  const bool is_new = version == "HTTP/1.1";
  if (!is_new && version != "HTTP/1.0") return {kVersionNotSupported, 0};
  if (!std::all_of(sent.begin(), sent.end(), IsWellFormed)) return {kBadRequest, 0};
  const size_t hosts = sent.Count("Host");
  if (hosts > 1 || (is_new && hosts == 0)) return {kBadRequest, 0};
  return JudgeLength(sent);
}

}  // namespace web
