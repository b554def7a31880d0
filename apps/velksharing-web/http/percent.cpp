#include "http/percent.h"

#include "http/text.h"

namespace web {
namespace {

bool IsUnreserved(char byte) {
  return IsLetterOrDigit(byte) || byte == '-' || byte == '.' || byte == '_' || byte == '~';
}

}  // namespace

bool AppendPercentDecoded(std::string_view text, std::string &out) {
  for (size_t at = 0; at < text.size(); ++at) {
    const auto byte = static_cast<unsigned char>(text[at]);
    if (byte <= ' ' || byte == 0x7f) return false;
    if (byte != '%') {
      out += text[at];
      continue;
    }
    if (text.size() - at < 3) return false;
    const int high = HexDigitValue(text[at + 1]);
    const int low = HexDigitValue(text[at + 2]);
    if (high < 0 || low < 0) return false;
    out += static_cast<char>(high * 16 + low);
    at += 2;
  }
  return true;
}

std::optional<std::string> PercentDecode(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  if (!AppendPercentDecoded(text, out)) return std::nullopt;
  return out;
}

std::string PercentEncode(std::string_view text) {
  constexpr char kDigits[] = "0123456789ABCDEF";
  std::string out;
  out.reserve(text.size());
  for (const char byte : text) {
    if (IsUnreserved(byte)) {
      out += byte;
      continue;
    }
    const auto value = static_cast<unsigned char>(byte);
    out += '%';
    out += kDigits[value >> 4];
    out += kDigits[value & 0x0f];
  }
  return out;
}

}  // namespace web
