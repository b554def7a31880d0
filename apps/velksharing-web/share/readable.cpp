#include "share/readable.h"

#include "http/utf8.h"

namespace web::share {
namespace {

// Latin-1 has control characters, too, from 0x80 to 0x9F; in UTF-8 these begin with 0xC2.
bool IsControl(std::string_view character) {
  const auto first = static_cast<unsigned char>(character[0]);
  if (character.size() == 1) return first < 0x20 || first == 0x7F;
  return first == 0xC2 && static_cast<unsigned char>(character[1]) < 0xA0;
}

std::string FromLatin1(char byte) {
  const auto code = static_cast<unsigned char>(byte);
  return {static_cast<char>(0xC0 | code >> 6), static_cast<char>(0x80 | (code & 0x3F))};
}

}  // namespace

std::string Readable(std::string_view name) {
  std::string text;
  while (!name.empty()) {
    const size_t length = Utf8CharacterLength(name);
    const std::string character =
        length == 0 ? FromLatin1(name[0]) : std::string(name.substr(0, length));
    text += IsControl(character) ? "_" : character;
    name.remove_prefix(length == 0 ? 1 : length);
  }
  return text;
}

}  // namespace web::share
