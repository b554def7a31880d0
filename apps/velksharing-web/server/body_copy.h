#ifndef VELKSHARING_WEB_SERVER_BODY_COPY_H
#define VELKSHARING_WEB_SERVER_BODY_COPY_H

#include <cstdint>
#include <functional>

#include "http/response.h"

namespace web {

/// Takes the next bytes; false when the other end is gone.
using Sink = std::function<bool(const char *bytes, size_t size)>;

struct Copied {
  uint64_t bytes = 0;
  bool is_whole = false;  ///< Whether it was all of the body.
};

/// Hands a body over, piece by piece.
Copied CopyBody(Response &response, const Sink &sink);

/// Puts a small file's bytes in the place of the file: so they leave together with the head. One
/// that cannot be read whole stays as it is.
void TakeSmallFileIn(Response &response);

}  // namespace web

#endif
