#include "share/preview.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>

#include "share/media_type.h"
#include "share/utf8.h"

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

template <size_t Count>
bool IsIn(const std::array<std::string_view, Count> &list, std::string_view text) {
  return std::find(list.begin(), list.end(), text) != list.end();
}

bool StartsWith(std::string_view text, std::string_view start) {
  return text.substr(0, start.size()) == start;
}

bool EndsWith(std::string_view text, std::string_view end) {
  return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

bool IsTextType(std::string_view type) {
  return StartsWith(type, "text/") || EndsWith(type, "+xml") || EndsWith(type, "+json") ||
         IsIn(kTextsByAnotherName, type);
}

PreviewKind PreviewByType(std::string_view type) {
  if (type == "application/pdf") return PreviewKind::PDF;
  if (IsIn(kImages, type)) return PreviewKind::IMAGE;
  if (StartsWith(type, "audio/")) return PreviewKind::AUDIO;
  if (StartsWith(type, "video/")) return PreviewKind::VIDEO;
  return IsTextType(type) ? PreviewKind::TEXT : PreviewKind::OTHER;
}

// A text may have lines, tabs and pages, and the escapes that terminals know.
bool IsControl(char byte) {
  constexpr std::string_view kAllowed = "\t\n\r\f\b\x1B";
  const auto code = static_cast<unsigned char>(byte);
  return (code < 0x20 || code == 0x7F) && kAllowed.find(byte) == std::string_view::npos;
}

std::optional<std::string> ReadStart(const Item &file, size_t limit) {
  std::string start(limit, '\0');
  size_t filled = 0;
  while (filled < limit) {
    const ssize_t count =
        pread(file.file.get(), start.data() + filled, limit - filled, static_cast<off_t>(filled));
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return std::nullopt;
    if (count == 0) break;
    filled += static_cast<size_t>(count);
  }
  start.resize(filled);
  return start;
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
  if (!start || std::any_of(start->begin(), start->end(), IsControl)) return std::nullopt;
  const bool is_cut = static_cast<off_t>(start->size()) < file.size;
  const size_t length = Utf8Length(*start);
  const bool is_text = length == start->size() ||
                       (is_cut && IsCutUtf8Character(std::string_view(*start).substr(length)));
  if (!is_text) return std::nullopt;
  start->resize(length);
  return TextStart{std::move(*start), is_cut};
}

bool MayHaveThumbnail(std::string_view name, off_t size) {
  return size > 0 && size <= kLargestImage && IsIn(kImagesToShrink, MediaTypeByName(name));
}

}  // namespace web::share
