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

bool StartsWith(std::string_view text, std::string_view start) {
  return text.substr(0, start.size()) == start;
}

template <size_t Count>
bool IsIn(const std::array<std::string_view, Count> &list, std::string_view text) {
  return std::find(list.begin(), list.end(), text) != list.end();
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
  return StartsWith(media_type, "audio/") || StartsWith(media_type, "video/") ||
         IsIn(kShownInline, media_type);
}

bool IsCompressed(std::string_view media_type) {
  return StartsWith(media_type, "audio/") || StartsWith(media_type, "video/") ||
         IsIn(kCompressed, media_type);
}

}  // namespace web::share
