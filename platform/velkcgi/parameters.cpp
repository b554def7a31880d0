#include "parameters.h"

#include <strings.h>

#include <algorithm>

#include "request.h"

namespace velk {
namespace {

constexpr std::string_view kFormType = "application/x-www-form-urlencoded";

int HexValue(char digit) {
  if (digit >= '0' && digit <= '9') return digit - '0';
  if (digit >= 'a' && digit <= 'f') return digit - 'a' + 10;
  if (digit >= 'A' && digit <= 'F') return digit - 'A' + 10;
  return -1;
}

/// The byte of the escape at the start of `text`; -1 when it is none.
int EscapedByte(std::string_view text) {
  if (text.size() < 3 || text[0] != '%') return -1;
  const int high = HexValue(text[1]);
  const int low = HexValue(text[2]);
  return high < 0 || low < 0 ? -1 : high * 16 + low;
}

/// Takes what stands for one decoded byte off `encoded`, which must not be empty.
char TakeByte(std::string_view &encoded) {
  const int escaped = EscapedByte(encoded);
  const char byte = encoded[0] == '+' ? ' ' : encoded[0];
  encoded.remove_prefix(escaped >= 0 ? 3 : 1);
  return escaped >= 0 ? static_cast<char>(escaped) : byte;
}

size_t DecodedLength(std::string_view encoded) {
  size_t length = 0;
  for (; !encoded.empty(); ++length) TakeByte(encoded);
  return length;
}

Secret Decode(std::string_view encoded) {
  Secret decoded(DecodedLength(encoded));
  for (char *out = decoded.data(); !encoded.empty(); ++out) *out = TakeByte(encoded);
  return decoded;
}

/// Takes the part before the first `separator` off `rest`.
std::string_view TakeUpTo(char separator, std::string_view &rest) {
  const std::string_view part = rest.substr(0, rest.find(separator));
  rest.remove_prefix(std::min(part.size() + 1, rest.size()));
  return part;
}

bool IsForm() {
  const char *value = RequestVariable("CONTENT_TYPE");
  if (value == nullptr || strncasecmp(value, kFormType.data(), kFormType.size()) != 0) return false;
  const char next = value[kFormType.size()];
  return next == '\0' || next == ';' || next == ' ' || next == '\t';
}

}  // namespace

std::optional<Secret> FindParameter(std::string_view encoded, std::string_view name) {
  while (!encoded.empty()) {
    std::string_view value = TakeUpTo('&', encoded);
    if (Decode(TakeUpTo('=', value)).view() != name) continue;
    Secret decoded = Decode(value);
    if (decoded.view().find('\0') != std::string_view::npos) return std::nullopt;
    return decoded;
  }
  return std::nullopt;
}

std::optional<Secret> RequestParameter(std::string_view name) {
  const char *query = RequestVariable("QUERY_STRING");
  if (query != nullptr) {
    if (auto value = FindParameter(query, name)) return value;
  }
  return IsForm() ? FindParameter(RequestBody(), name) : std::nullopt;
}

}  // namespace velk
