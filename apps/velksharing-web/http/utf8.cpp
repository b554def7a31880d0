#include "http/utf8.h"

#include <cstdint>
#include <cstring>

namespace web {
namespace {

constexpr size_t kLongest = 4;

unsigned char ByteAt(std::string_view text, size_t index) {
  return static_cast<unsigned char>(text[index]);
}

// By its first byte; 0 for a byte that begins no character.
size_t ExpectedLength(unsigned char first) {
  if (first < 0x80) return 1;
  if (first < 0xC2) return 0;
  if (first < 0xE0) return 2;
  if (first < 0xF0) return 3;
  if (first < 0xF5) return 4;
  return 0;
}

// The second byte is what tells overlong forms, surrogates, and numbers beyond the last character.
bool MayFollow(unsigned char first, unsigned char second) {
  switch (first) {
    case 0xE0:
      return second >= 0xA0 && second <= 0xBF;
    case 0xED:
      return second >= 0x80 && second <= 0x9F;
    case 0xF0:
      return second >= 0x90 && second <= 0xBF;
    case 0xF4:
      return second >= 0x80 && second <= 0x8F;
    default:
      return second >= 0x80 && second <= 0xBF;
  }
}

// How many of the first `length` bytes of `text` could be those of one character.
size_t PlausibleBytes(std::string_view text, size_t length) {
  if (length == 0) return 0;
  size_t count = 1;
  for (; count < length && count < text.size(); ++count) {
    const unsigned char byte = ByteAt(text, count);
    const bool fits = count == 1 ? MayFollow(ByteAt(text, 0), byte) : (byte & 0xC0) == 0x80;
    if (!fits) break;
  }
  return count;
}

// How many ASCII characters a text begins with, or up to seven fewer: they are looked at in eights.
size_t AsciiLength(std::string_view text) {
  constexpr uint64_t kBeyondAscii = 0x8080808080808080;
  size_t length = 0;
  for (uint64_t bytes = 0; length + sizeof bytes <= text.size(); length += sizeof bytes) {
    memcpy(&bytes, text.data() + length, sizeof bytes);
    if ((bytes & kBeyondAscii) != 0) break;
  }
  return length;
}

}  // namespace

size_t Utf8CharacterLength(std::string_view text) {
  if (text.empty()) return 0;
  const size_t length = ExpectedLength(ByteAt(text, 0));
  return PlausibleBytes(text, length) == length ? length : 0;
}

size_t Utf8Length(std::string_view text) {
  size_t length = 0;
  while (true) {
    length += AsciiLength(text.substr(length));
    const size_t step = Utf8CharacterLength(text.substr(length));
    if (step == 0) return length;
    length += step;
  }
}

bool IsCutUtf8Character(std::string_view rest) {
  if (rest.empty() || rest.size() >= kLongest) return false;
  const size_t length = ExpectedLength(ByteAt(rest, 0));
  return rest.size() < length && PlausibleBytes(rest, length) == rest.size();
}

}  // namespace web
