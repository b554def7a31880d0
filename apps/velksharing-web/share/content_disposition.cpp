#include "share/content_disposition.h"

#include "http/percent.h"
#include "http/utf8.h"
#include "share/readable.h"

namespace web::share {
namespace {

// Browsers take these for the end of the value, an escape or a folder.
constexpr std::string_view kTroublesome = "\"\\%/";

bool IsPlain(char character) {
  return character >= ' ' && character <= '~' &&
         kTroublesome.find(character) == std::string_view::npos;
}

// One '_' for each character that is not plain; `text` is UTF-8.
std::string Plain(std::string_view text) {
  std::string plain;
  while (!text.empty()) {
    plain += IsPlain(text[0]) ? text[0] : '_';
    text.remove_prefix(Utf8CharacterLength(text));
  }
  return plain;
}

}  // namespace

std::string ContentDisposition(std::string_view kind, std::string_view name) {
  const std::string readable = Readable(name);
  const std::string plain = Plain(readable);
  std::string value = std::string(kind) + "; filename=\"" + plain + "\"";
  if (plain != readable) value += "; filename*=UTF-8''" + PercentEncode(readable);
  return value;
}

}  // namespace web::share
