#ifndef VELKSHARING_WEB_SERVER_ANSWER_HEAD_H
#define VELKSHARING_WEB_SERVER_ANSWER_HEAD_H

#include <cstdint>
#include <optional>
#include <string>

#include "http/response.h"

namespace web {

/// Whether answers of a status never have a body: 204 and 304.
bool IsBodiless(int status);

/// Whether an answer has a body on the wire: none for HEAD, 204 and 304.
bool HasBody(const Response &response, const std::string &method);

/// Length of the body in bytes; nothing for one that is made while it is sent.
std::optional<uint64_t> BodyLength(const Response &response);

/// The head of an answer as CGI and FastCGI have it, the empty line at its end included. Fields
/// that could end a line early are left out; the log names them.
std::string CgiHead(const Response &response);

}  // namespace web

#endif
