#ifndef VELKSHARING_WEB_SERVER_FILE_OFFLOAD_H
#define VELKSHARING_WEB_SERVER_FILE_OFFLOAD_H

#include <optional>
#include <string>
#include <vector>

#include "http/response.h"
#include "server/settings.h"

namespace web {

/// Leaves the sending of files to the web server in front, where that is allowed to read them.
///
/// The web server opens the file once more, by its path and with its own rights, which are not
/// those of the link's owner. So only those files are left to it that lie below the folders that
/// the configuration names, on the path that the kernel gives for the open descriptor, and that
/// everybody on the machine may read. What an owner puts in the place of such a file a moment later
/// is what the web server would read then; it must be told not to follow symbolic links.
class FileOffload {
 public:
  explicit FileOffload(const Settings &settings);

  /// The header field that makes the web server send the body of this answer; nothing when the body
  /// has to be copied: parts of files, too, for the web server would cut them once more.
  std::optional<Fields::Field> FieldFor(const Response &response) const;

 private:
  bool IsBelowFolders(const std::string &path) const;

  FileDelivery delivery_;
  std::vector<std::string> folders_;
  std::string location_;
};

}  // namespace web

#endif
