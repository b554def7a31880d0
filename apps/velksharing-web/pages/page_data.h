#ifndef VELKSHARING_WEB_PAGES_PAGE_DATA_H
#define VELKSHARING_WEB_PAGES_PAGE_DATA_H

#include <string>
#include <string_view>
#include <vector>

#include "pages/addresses.h"
#include "pages/catalogue.h"
#include "pages/templates.h"
#include "pages/views.h"

/// Views as what their templates show: texts that may stand in a page, addresses, sizes and times
/// as the language writes them. Escaping is left to the templates. A name that a template asks for
/// is always there, false when there is nothing to show: otherwise it would be looked for in what
/// stands around.

namespace web {

/// What a page is made with.
struct PageTools {
  const Addresses &addresses;
  const Catalogue &texts;
};

Data FolderData(const FolderView &view, const PageTools &tools);
Data FileData(const FileView &view, const PageTools &tools);

/// The link's title, or the catalogue's word for links without one.
std::string TitleOf(const LinkView &link, const Catalogue &texts);

/// The host that an http(s) address leads to, as a browser reads it.
std::string_view HostOf(std::string_view address);

/// Sets a text, or false for an empty one.
void SetOrFalse(Data &data, const std::string &name, std::string_view text);
void SetFlag(Data &data, const std::string &name, bool value);

/// Sets "crumbs", the way from what is shared down to the end of `path`, and "has_path".
void SetCrumbs(Data &data, const LinkView &link, const std::vector<std::string> &path,
               const PageTools &tools);
/// Sets "date" and "iso_date".
void SetDate(Data &data, time_t time, const Catalogue &texts);
/// Sets "continue_to" and "continue_label".
void SetContinue(Data &data, const LinkView &link, const Catalogue &texts);

/// "image", as icons and texts call a kind.
const char *KindName(FileKind kind);

}  // namespace web

#endif
