#include "pages/assets.h"

#include <cstdint>
#include <utility>

namespace web {
namespace {

/// FNV-1a. Tells one release's file from the next one's; nobody gains by making two alike.
std::string Digest(std::string_view bytes) {
  uint64_t sum = 0xCBF29CE484222325;
  for (const char byte : bytes) {
    sum = (sum ^ static_cast<unsigned char>(byte)) * 0x100000001B3;
  }
  constexpr char kDigits[] = "0123456789abcdef";
  std::string digits;
  for (int shift = 60; shift >= 0; shift -= 4) digits += kDigits[sum >> shift & 15];
  return digits;
}

std::string TypeOf(std::string_view extension) {
  if (extension == ".css") return "text/css; charset=utf-8";
  return extension == ".png" ? "image/png" : "image/svg+xml";
}

}  // namespace

std::string Assets::Add(std::string_view file_name, std::string bytes) {
  const size_t dot = file_name.rfind('.');
  const std::string_view extension = file_name.substr(dot);
  std::string name(file_name.substr(0, dot));
  name.append("-").append(Digest(bytes)).append(extension);
  assets_.insert_or_assign(name, Asset{TypeOf(extension), std::move(bytes)});
  return name;
}

const Asset *Assets::Find(std::string_view name) const {
  const auto found = assets_.find(name);
  return found == assets_.end() ? nullptr : &found->second;
}

}  // namespace web
