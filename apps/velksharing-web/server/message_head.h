#ifndef VELKSHARING_WEB_SERVER_MESSAGE_HEAD_H
#define VELKSHARING_WEB_SERVER_MESSAGE_HEAD_H

#include <cstdint>
#include <string_view>

#include "http/request.h"

namespace web {

/// Whether the head of an HTTP message, as it came over the network, may be served. What two
/// programs could understand differently is refused: where one of them stands in front of the
/// other, a visitor could slip a second request past the first.
struct HeadVerdict {
  int refusal = 0;           ///< Status to refuse it with, 0 for none.
  uint64_t body_length = 0;  ///< Announced; 0 where it cannot be told.
};

/// @param request with all header fields; those that only concern the connection, and those whose
///        name CGI could confuse with another, are taken away.
/// @param version as sent: "HTTP/1.1".
HeadVerdict JudgeHead(Request &request, std::string_view version);

}  // namespace web

#endif
