#ifndef VELKSHARING_WEB_SERVER_CGI_REQUEST_H
#define VELKSHARING_WEB_SERVER_CGI_REQUEST_H

#include <cstdint>
#include <functional>
#include <string_view>

#include "http/request.h"

namespace web {

/// Reads up to `size` bytes of a request body; 0 at its end, negative when it breaks.
using BodyReader = std::function<ssize_t(char *buffer, size_t size)>;

/// A request as a web server hands it over by CGI and FastCGI.
struct CgiRequest {
  Request request;
  int refusal = 0;  ///< Status to refuse it with, 0 for none.
};

/// Whether one of these "NAME=value" texts, which end with null, has this name.
bool HasVariable(const char *const *environment, std::string_view name);

/// Method, header fields and visitor of a request; no target and no body.
Request ReadCgiHead(const char *const *environment);

/// Makes a request of "NAME=value" texts, which end with null, and of the body. The target is
/// REQUEST_URI as the visitor sent it; a web server without that has SCRIPT_NAME and PATH_INFO, and
/// they are encoded again. The visitor is REMOTE_ADDR, and nothing else.
CgiRequest ReadCgiRequest(const char *const *environment, const BodyReader &body);

}  // namespace web

#endif
