#include "pages/shown_text.h"

#include <algorithm>
#include <cstdint>

namespace web {
namespace {

constexpr std::string_view kReplacement = "\xEF\xBF\xBD";

/// One character of UTF-8; `length` 0 when the bytes are none.
struct Character {
  uint32_t code = 0;
  size_t length = 0;
};

bool IsContinuation(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0) == 0x80;
}

/// How long the character is that begins with `first`; 0 when none does.
size_t LengthFrom(unsigned char first) {
  if (first < 0x80) return 1;
  if (first >= 0xC2 && first <= 0xDF) return 2;
  if (first >= 0xE0 && first <= 0xEF) return 3;
  if (first >= 0xF0 && first <= 0xF4) return 4;
  return 0;
}

Character Decode(std::string_view bytes) {
  constexpr uint32_t kSmallest[] = {0, 0, 0x80, 0x800, 0x10000};
  const auto first = static_cast<unsigned char>(bytes.front());
  const size_t length = LengthFrom(first);
  if (length == 1) return {first, 1};
  if (length == 0 || length > bytes.size()) return {};

  uint32_t code = first & (0xFFu >> (length + 1));
  for (const char byte : bytes.substr(1, length - 1)) {
    if (!IsContinuation(byte)) return {};
    code = code << 6 | (static_cast<unsigned char>(byte) & 0x3Fu);
  }
  const bool is_surrogate = code >= 0xD800 && code <= 0xDFFF;
  if (code < kSmallest[length] || code > 0x10FFFF || is_surrogate) return {};
  return {code, length};
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
    const Character character = Decode(bytes);
    const size_t length = std::max<size_t>(character.length, 1);
    const bool is_kept = character.length > 0 && is_shown(character.code);
    text += is_kept ? bytes.substr(0, length) : kReplacement;
    bytes.remove_prefix(length);
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
  size_t tail = 0;
  while (tail < 3 && tail < bytes.size() && IsContinuation(bytes[bytes.size() - 1 - tail])) ++tail;
  if (tail == bytes.size()) return bytes;
  const size_t start = bytes.size() - 1 - tail;
  const bool is_cut = LengthFrom(static_cast<unsigned char>(bytes[start])) > tail + 1;
  return is_cut ? bytes.substr(0, start) : bytes;
}

bool SurvivesForms(std::string_view name) {
  while (!name.empty()) {
    const Character character = Decode(name);
    const bool is_changed =
        character.code == '\0' || character.code == '\n' || character.code == '\r';
    if (character.length == 0 || is_changed) return false;
    name.remove_prefix(character.length);
  }
  return true;
}

}  // namespace web
