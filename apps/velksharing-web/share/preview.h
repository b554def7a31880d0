#ifndef VELKSHARING_WEB_SHARE_PREVIEW_H
#define VELKSHARING_WEB_SHARE_PREVIEW_H

#include <optional>
#include <string>
#include <string_view>

#include "share/item.h"

namespace web::share {

/// How a page can show a file.
enum class PreviewKind {
  TEXT,   ///< In the page itself, escaped: ReadText().
  IMAGE,  ///< <img src="?view">
  AUDIO,  ///< <audio src="?view">
  VIDEO,  ///< <video src="?view">
  PDF,    ///< The browser's own viewer, at "?view".
  OTHER,  ///< Not at all.
};

/// By the name alone. TEXT is a guess: the content may turn out to be something else.
PreviewKind PreviewByName(std::string_view name);

/// By the name and, where that says text or nothing, by the first bytes: TEXT only for UTF-8
/// without control characters. A folder is OTHER.
PreviewKind PreviewOf(const Item &file);

struct TextStart {
  std::string text;     ///< Valid UTF-8.
  bool is_cut = false;  ///< Whether the file goes on.
};

/// The beginning of a text file.
/// @param limit in bytes; a character at the end is not cut in two.
/// @return nothing when the file is not UTF-8 text or cannot be read.
std::optional<TextStart> ReadText(const Item &file, size_t limit);

/// Whether MakeThumbnail() is worth trying, by name and size.
bool MayHaveThumbnail(std::string_view name, off_t size);

}  // namespace web::share

#endif
