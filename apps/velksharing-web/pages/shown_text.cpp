#include "pages/shown_text.h"

#include <algorithm>
#include <cstdint>

#include "http/utf8.h"

namespace web {
namespace {

constexpr std::string_view kReplacement = "\xEF\xBF\xBD";

/// The number of the character that `bytes`, its UTF-8, are.
uint32_t CodeOf(std::string_view bytes) {
  const auto first = static_cast<unsigned char>(bytes.front());
  if (bytes.size() == 1) return first;
  uint32_t code = first & (0xFFu >> (bytes.size() + 1));
  for (const char byte : bytes.substr(1)) {
    code = code << 6 | (static_cast<unsigned char>(byte) & 0x3Fu);
  }
  return code;
}

bool IsControl(uint32_t code) {
  return code < 0x20 || (code >= 0x7F && code <= 0x9F);
}

bool TurnsDirection(uint32_t code) {
  return (code >= 0x202A && code <= 0x202E) || (code >= 0x2066 && code <= 0x2069);
}

bool IsLineOrTab(uint32_t code) {
  return code == '\n' || code == '\r' || code == '\t';
}

/// `bytes` with U+FFFD in the place of whatever `is_shown` refuses.
template <typename IsShown>
std::string Shown(std::string_view bytes, IsShown is_shown) {
  std::string text;
  text.reserve(bytes.size());
  while (!bytes.empty()) {
    const size_t length = Utf8CharacterLength(bytes);
    const std::string_view character = bytes.substr(0, std::max<size_t>(length, 1));
    text += length > 0 && is_shown(CodeOf(character)) ? character : kReplacement;
    bytes.remove_prefix(character.size());
  }
  return text;
}

}  // namespace

std::string ShownName(std::string_view bytes) {
  return Shown(bytes, [](uint32_t code) { return !IsControl(code) && !TurnsDirection(code); });
}

std::string ShownText(std::string_view bytes) {
  constexpr std::string_view kMark = "\xEF\xBB\xBF";
  if (bytes.substr(0, kMark.size()) == kMark) bytes.remove_prefix(kMark.size());
  return Shown(bytes, [](uint32_t code) { return !IsControl(code) || IsLineOrTab(code); });
}

std::string_view WithoutCutCharacter(std::string_view bytes) {
  for (size_t tail = 1; tail <= std::min<size_t>(bytes.size(), 3); ++tail) {
    const std::string_view kept = bytes.substr(0, bytes.size() - tail);
    if (IsCutUtf8Character(bytes.substr(kept.size()))) return kept;
  }
  return bytes;
}

bool SurvivesForms(std::string_view name) {
  constexpr std::string_view kChanged("\0\r\n", 3);
  return Utf8Length(name) == name.size() && name.find_first_of(kChanged) == std::string_view::npos;
}

}  // namespace web
