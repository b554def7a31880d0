#ifndef VELKSHARING_WEB_PAGES_SHOWN_TEXT_H
#define VELKSHARING_WEB_PAGES_SHOWN_TEXT_H

#include <string>
#include <string_view>

/// Bytes of unknown origin as UTF-8 that may stand in a page. Nothing is escaped here.

namespace web {

/// `bytes` as one line: broken UTF-8, control characters, and marks that turn the direction of the
/// text around (by which "exe.gpj" looks like "jpg.exe") become U+FFFD.
std::string ShownName(std::string_view bytes);

/// `bytes` as lines of text: broken UTF-8 and control characters other than tab and line ends
/// become U+FFFD; a mark of UTF-8 at the beginning goes.
std::string ShownText(std::string_view bytes);

/// `bytes` without the character that their end may have cut in two.
std::string_view WithoutCutCharacter(std::string_view bytes);

/// Whether a form that holds `name` sends back these very bytes: browsers change broken UTF-8 and
/// line ends.
bool SurvivesForms(std::string_view name);

}  // namespace web

#endif
