#ifndef VELKSHARING_WEB_PAGES_EMBEDDED_FILES_H
#define VELKSHARING_WEB_PAGES_EMBEDDED_FILES_H

#include <string_view>
#include <vector>

namespace web {

/// A file of the source tree that is part of the program.
struct EmbeddedFile {
  std::string_view name;  ///< Below pages/: "templates/folder.mustache".
  std::string_view content;
};

/// All of them, in the order of the build file. The source is made by embed.cmake.
const std::vector<EmbeddedFile> &EmbeddedFiles();

}  // namespace web

#endif
