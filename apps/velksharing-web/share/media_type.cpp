#include "share/media_type.h"

#include <syslog.h>

#include <algorithm>
#include <array>
#include <fstream>
#include <sstream>
#include <unordered_map>

namespace web::share {
namespace {

constexpr char kDatabase[] = "/etc/mime.types";

constexpr std::array<std::string_view, 7> kShownInline = {
    "text/plain", "image/png",  "image/jpeg",      "image/gif",
    "image/webp", "image/avif", "application/pdf",
};

constexpr std::array<std::string_view, 13> kCompressed = {
    "image/png",
    "image/jpeg",
    "image/gif",
    "image/webp",
    "image/avif",
    "image/heic",
    "application/zip",
    "application/gzip",
    "application/x-bzip2",
    "application/x-xz",
    "application/zstd",
    "application/x-7z-compressed",
    "application/java-archive",
};

using TypesByEnding = std::unordered_map<std::string, std::string>;

std::string LowerCase(std::string_view text) {
  std::string lower(text);
  std::transform(lower.begin(), lower.end(), lower.begin(), [](char letter) {
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
  });
  return lower;
}

// "text/html   html htm shtml"
void AddLine(const std::string &line, TypesByEnding &types) {
  std::istringstream words(line.substr(0, line.find('#')));
  std::string type;
  words >> type;
  for (std::string ending; words >> ending;) types.emplace(LowerCase(ending), LowerCase(type));
}

TypesByEnding ReadDatabase() {
  TypesByEnding types;
  std::ifstream database(kDatabase);
  for (std::string line; std::getline(database, line);) AddLine(line, types);
  if (types.empty()) syslog(LOG_ERR, "no media types in %s: files have no previews", kDatabase);
  return types;
}

}  // namespace

const std::string &MediaTypeByName(std::string_view name) {
  static const TypesByEnding types = ReadDatabase();
  static const std::string unknown;
  const size_t dot = name.rfind('.');
  if (dot == std::string_view::npos) return unknown;
  const auto found = types.find(LowerCase(name.substr(dot + 1)));
  return found == types.end() ? unknown : found->second;
}

bool IsShownInline(std::string_view media_type) {
  return media_type.starts_with("audio/") || media_type.starts_with("video/") ||
         std::ranges::count(kShownInline, media_type) > 0;
}

bool IsCompressed(std::string_view media_type) {
  return media_type.starts_with("audio/") || media_type.starts_with("video/") ||
         std::ranges::count(kCompressed, media_type) > 0;
}

}  // namespace web::share
