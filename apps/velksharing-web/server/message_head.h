#ifndef VELKSHARING_WEB_SERVER_MESSAGE_HEAD_H
#define VELKSHARING_WEB_SERVER_MESSAGE_HEAD_H

#include <cstdint>
#include <string_view>
#include <vector>

#include "http/request.h"

namespace web {

/// Whether the head of an HTTP message, as it came over the network, may be served. What two
/// programs could understand differently is refused: where one of them stands in front of the
/// other, a visitor could slip a second request past the first.
struct HeadVerdict {
  int refusal = 0;           ///< Status to refuse it with, 0 for none.
  uint64_t body_length = 0;  ///< Announced; 0 where it cannot be told.
};

/// One header field where the HTTP library found it: texts in the bytes that were read.
struct RawField {
  std::string_view name;
  std::string_view value;
};

/// Whether a head is nothing but what the library found in it: lines "name: value" one behind the
/// other, with blanks around the value at most. The library passes over folded lines, names that
/// are empty and zero bytes in its own ways, which others read differently.
/// @param head all bytes of it; the library has put zero bytes in the place of line ends and
/// colons.
/// @param version the last word of the first line.
bool IsAccountedFor(std::string_view head, std::string_view version,
                    const std::vector<RawField> &fields);

/// Judges by what the fields say.
/// @param request with all header fields; those that only concern the connection, and those whose
///        name CGI could confuse with another, are taken away.
/// @param version as sent: "HTTP/1.1".
HeadVerdict JudgeHead(Request &request, std::string_view version);

}  // namespace web

#endif
