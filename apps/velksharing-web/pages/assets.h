#ifndef VELKSHARING_WEB_PAGES_ASSETS_H
#define VELKSHARING_WEB_PAGES_ASSETS_H

#include <map>
#include <string>
#include <string_view>

#include "pages/pages.h"

namespace web {

/// The files that pages refer to. Their names hold a digest of their content, so that a browser
/// may keep them for ever and yet never uses an old one.
class Assets {
 public:
  /// @param file_name as people call it: "style.css".
  /// @return the name under which it is found: "style-0123456789abcdef.css".
  std::string Add(std::string_view file_name, std::string bytes);

  /// Null when there is none; valid as long as this.
  const Asset *Find(std::string_view name) const;

 private:
  std::map<std::string, Asset, std::less<>> assets_;
};

}  // namespace web

#endif
