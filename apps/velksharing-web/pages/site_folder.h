#ifndef VELKSHARING_WEB_PAGES_SITE_FOLDER_H
#define VELKSHARING_WEB_PAGES_SITE_FOLDER_H

#include <map>
#include <string>

namespace web {

/// Contents by name: "templates/folder.mustache", "catalogues/de.json", "style.css", "logo.png".
using SourceFiles = std::map<std::string, std::string>;

/// Reads what a site has of its own: templates/*.mustache, catalogues/*.json, style.css, logo.svg,
/// logo.png. Other files are left alone.
/// @param[out] error which file cannot be read, and why; one line.
/// @return whether all were read; false for a folder that does not exist.
bool ReadSiteFolder(const std::string &folder, SourceFiles &files, std::string &error);

}  // namespace web

#endif
