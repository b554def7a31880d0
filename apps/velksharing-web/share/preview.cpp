#include "share/preview.h"

#include <algorithm>
#include <array>

#include "http/utf8.h"
#include "share/media_type.h"

namespace web::share {
namespace {

constexpr size_t kSniffed = 4096;
constexpr off_t kLargestImage = 32 * 1024 * 1024;

constexpr std::array<std::string_view, 5> kImages = {
    "image/png", "image/jpeg", "image/gif", "image/webp", "image/avif",
};
constexpr std::array<std::string_view, 4> kImagesToShrink = {
    "image/png",
    "image/jpeg",
    "image/gif",
    "image/webp",
};
constexpr std::array<std::string_view, 9> kTextsByAnotherName = {
    "application/json", "application/xml",         "application/sql",
    "application/x-sh", "application/x-csh",       "application/x-perl",
    "application/yaml", "application/x-httpd-php", "message/rfc822",
};

bool IsTextType(std::string_view type) {
  return type.starts_with("text/") || type.ends_with("+xml") || type.ends_with("+json") ||
         std::ranges::count(kTextsByAnotherName, type) > 0;
}

PreviewKind PreviewByType(std::string_view type) {
  if (type == "application/pdf") return PreviewKind::PDF;
  if (std::ranges::count(kImages, type) > 0) return PreviewKind::IMAGE;
  if (type.starts_with("audio/")) return PreviewKind::AUDIO;
  if (type.starts_with("video/")) return PreviewKind::VIDEO;
  return IsTextType(type) ? PreviewKind::TEXT : PreviewKind::OTHER;
}

// A text may have lines, tabs and pages, and the escapes that terminals know.
constexpr bool IsControl(char byte) {
  constexpr std::string_view kAllowed = "\t\n\r\f\b\x1B";
  const auto code = static_cast<unsigned char>(byte);
  return (code < 0x20 || code == 0x7F) && kAllowed.find(byte) == std::string_view::npos;
}

constexpr std::array<bool, 256> kIsControl = [] {
  std::array<bool, 256> is_control{};
  for (size_t code = 0; code < is_control.size(); ++code)
    is_control[code] = IsControl(static_cast<char>(code));
  return is_control;
}();

bool HasControl(std::string_view text) {
  return std::ranges::any_of(
      text, [](char byte) { return kIsControl[static_cast<unsigned char>(byte)]; });
}

}  // namespace

PreviewKind PreviewByName(std::string_view name) {
  return PreviewByType(MediaTypeByName(name));
}

PreviewKind PreviewOf(const Item &file) {
  if (file.is_folder) return PreviewKind::OTHER;
  const std::string &type = MediaTypeByName(file.name);
  const PreviewKind kind = PreviewByType(type);
  const bool may_be_text = kind == PreviewKind::TEXT || type.empty();
  if (!may_be_text) return kind;
  return ReadText(file, kSniffed) ? PreviewKind::TEXT : PreviewKind::OTHER;
}

std::optional<TextStart> ReadText(const Item &file, size_t limit) {
  if (file.is_folder) return std::nullopt;
  std::optional<std::string> start = ReadStart(file, limit);
  if (!start || HasControl(*start)) return std::nullopt;
  const bool is_cut = static_cast<off_t>(start->size()) < file.size;
  const size_t length = Utf8Length(*start);
  const bool is_text = length == start->size() ||
                       (is_cut && IsCutUtf8Character(std::string_view(*start).substr(length)));
  if (!is_text) return std::nullopt;
  start->resize(length);
  return TextStart{std::move(*start), is_cut};
}

bool MayHaveThumbnail(std::string_view name, off_t size) {
  return size > 0 && size <= kLargestImage &&
         std::ranges::count(kImagesToShrink, MediaTypeByName(name)) > 0;
}

}  // namespace web::share
