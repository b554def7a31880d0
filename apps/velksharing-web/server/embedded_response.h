#ifndef VELKSHARING_WEB_SERVER_EMBEDDED_RESPONSE_H
#define VELKSHARING_WEB_SERVER_EMBEDDED_RESPONSE_H

#include <microhttpd.h>

#include <cstdint>
#include <memory>
#include <string>

#include "http/response.h"

namespace web {

using EmbeddedResponse = std::unique_ptr<MHD_Response, decltype(&MHD_destroy_response)>;

/// An answer as the HTTP library sends it: a file from where it lies, a stream piece by piece.
/// Fields that cannot be sent are left out; the log names them.
/// @param response gives its body away.
/// @param method of the request: HEAD gets no body.
/// @param bytes counts what a stream gives; must live as long as the answer is being sent.
/// @return null when memory runs out.
EmbeddedResponse MakeEmbeddedResponse(Response &response, const std::string &method,
                                      uint64_t &bytes);

}  // namespace web

#endif
