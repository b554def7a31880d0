// Any bytes as the head of an HTTP request: which fields the HTTP library found in it is made up,
// too. What passes must be so plain that every other reader finds the same fields.

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "http/text.h"
#include "require.h"
#include "server/limits.h"
#include "server/message_head.h"
#include "server/target.h"

namespace {

using velk_test::Require;
using web::HeadVerdict;
using web::RawField;
using web::Request;

/// Ends lines and names with zero bytes, as the library does, and finds the fields in the simplest
/// way.
std::vector<RawField> Prepare(std::string &head, std::string_view &version) {
  std::vector<RawField> fields;
  size_t at = head.find("\r\n");
  if (at == std::string::npos) return fields;
  version = std::string_view(head).substr(0, at);
  while (at + 2 < head.size()) {
    head[at] = head[at + 1] = '\0';
    const size_t begin = at + 2;
    at = head.find("\r\n", begin);
    if (at == std::string::npos || at == begin) break;
    const size_t colon = head.find(':', begin);
    if (colon == std::string::npos || colon > at) continue;
    head[colon] = '\0';
    const std::string_view value = std::string_view(head).substr(colon + 1, at - colon - 1);
    const std::string_view trimmed = web::Trimmed(value);
    fields.push_back({std::string_view(head).substr(begin, colon - begin),
                      trimmed.empty() ? std::string_view(head).substr(at, 0) : trimmed});
  }
  if (at != std::string::npos && at + 2 <= head.size()) head[at] = head[at + 1] = '\0';
  return fields;
}

/// A head that is accounted for can be written down anew from its fields: nothing is lost in it but
/// blanks around values.
void CheckAccount(std::string_view head, std::string_view version,
                  const std::vector<RawField> &fields) {
  if (!web::IsAccountedFor(head, version, fields)) return;
  std::string lean(version);
  for (const auto &[name, value] : fields) {
    lean += '\0';
    lean += '\0';
    lean.append(name) += '\0';
    lean.append(value);
  }
  lean.append(4, '\0');
  std::string without_blanks;
  for (const char byte : head)
    if (byte != ' ' && byte != '\t') without_blanks += byte;
  std::string lean_without_blanks;
  for (const char byte : lean)
    if (byte != ' ' && byte != '\t') lean_without_blanks += byte;
  Require(without_blanks == lean_without_blanks);
}

bool IsNameByte(char byte) {
  return web::IsLetterOrDigit(byte) || byte == '-';
}

/// What the handler gets.
void CheckJudgement(const std::vector<RawField> &fields) {
  Request request;
  for (const auto &[name, value] : fields)
    request.headers.Add(std::string(name), std::string(value));
  const auto sent = request.headers;
  const HeadVerdict verdict = web::JudgeHead(request, "HTTP/1.1");
  for (const auto &[name, value] : request.headers) {
    for (const char byte : name) Require(IsNameByte(byte));
    Require(!web::IsSameText(name, "Proxy") && !web::IsSameText(name, "Transfer-Encoding"));
  }
  if (verdict.refusal != 0) return;
  Require(sent.Count("Host") == 1 && sent.Count("Transfer-Encoding") == 0);
  Require(sent.Count("Content-Length") <= 1 && verdict.body_length <= web::kFormLimit);
  for (const auto &[name, value] : sent) {
    Require(!name.empty());
    Require(value.find_first_of(std::string_view("\0\r\n", 3)) == std::string::npos);
  }
}

void CheckTarget(std::string_view target) {
  Request request;
  if (!web::SetTarget(target, request)) return;
  Require(request.path.starts_with('/') && request.path.find('?') == std::string::npos);
  for (const std::string &part : {request.path, request.query})
    for (const char byte : part) Require(static_cast<unsigned char>(byte) > ' ' && byte != 0x7f);
  const std::string whole = request.path + (request.query.empty() ? "" : "?" + request.query);
  Require(target.find(whole) != std::string_view::npos);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  std::string head(reinterpret_cast<const char *>(data), size);
  CheckTarget(head.substr(0, head.find('\n')));
  std::string_view version;
  const std::vector<RawField> fields = Prepare(head, version);
  if (version.empty()) return 0;
  CheckAccount(head, version, fields);
  CheckJudgement(fields);
  return 0;
}
