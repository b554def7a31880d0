#ifndef VELKSHARING_WEB_SERVER_TARGET_H
#define VELKSHARING_WEB_SERVER_TARGET_H

#include <string_view>

#include "http/request.h"

namespace web {

/// Puts the target of a request line into path and query: "/sharing/x?zip", also in the form that
/// is meant for proxies, "http://host/sharing/x?zip".
/// @return false for what is no address of a thing on this server ("*", "host:443"), or holds a
/// blank or
///         control character.
bool SetTarget(std::string_view target, Request &request);

}  // namespace web

#endif
