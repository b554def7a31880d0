#ifndef VELKSHARING_WEB_HTTP_RESPONSE_H
#define VELKSHARING_WEB_HTTP_RESPONSE_H

#include <sys/types.h>

#include <memory>
#include <string>
#include <variant>

#include "http/fields.h"
#include "http/unique_fd.h"

namespace web {

/// A part of an open file, to be sent from where it lies.
struct FileBody {
  UniqueFd file;
  off_t offset = 0;
  off_t length = 0;  ///< In bytes; the file may turn out to be shorter when it is sent.
};

/// A body that is made while it is sent, of unknown length. Used by one thread at a time, which
/// need not be the one that made it.
class StreamBody {
 public:
  virtual ~StreamBody() = default;

  /// Gives the next bytes.
  /// @return how many; 0 at the end; -1 when it cannot go on: then the connection is cut, so that
  ///         nobody takes the half for the whole.
  virtual ssize_t Read(char *buffer, size_t capacity) = 0;
};

/// What the visitor gets. Whoever sends it adds Content-Length or chunks, and leaves the body of an
/// answer to HEAD, of 204 and of 304 out.
struct Response {
  int status = 200;
  Fields headers;
  std::variant<std::string, FileBody, std::unique_ptr<StreamBody>> body;
};

}  // namespace web

#endif
