#include "server/printable.h"

namespace web {
namespace {

bool IsPlain(char byte) {
  return byte > ' ' && byte <= '~' && byte != '"' && byte != '\\';
}

void AppendEscaped(char byte, std::string &text) {
  constexpr char kDigits[] = "0123456789abcdef";
  const auto value = static_cast<unsigned char>(byte);
  text += "\\x";
  text += kDigits[value >> 4];
  text += kDigits[value & 0xf];
}

}  // namespace

std::string Printable(std::string_view text, size_t longest) {
  if (text.empty()) return "-";
  std::string printable;
  for (const char byte : text.substr(0, longest)) {
    if (IsPlain(byte)) {
      printable += byte;
    } else {
      AppendEscaped(byte, printable);
    }
  }
  if (text.size() > longest) printable += "...";
  return printable;
}

}  // namespace web
