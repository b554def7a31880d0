#ifndef VELKWEBAPI_REPLY_H
#define VELKWEBAPI_REPLY_H

#include <json/value.h>

#include "request.h"

namespace webapi {

/// Does a request. Throws nothing that the answer could tell.
/// @return {"success": true, "data": …}, or {"success": false, "error": {"code": …, "message":
///         …}}.
Json::Value Answer(const Request &request);

/// The answer as one line of ASCII; a byte that is not UTF-8 becomes U+FFFD.
std::string ReplyText(const Json::Value &answer);

}  // namespace webapi

#endif
