#ifndef VELKSHARING_WEB_SITE_ROUTE_NAMES_H
#define VELKSHARING_WEB_SITE_ROUTE_NAMES_H

#include <string_view>

namespace web {

/// Everything that a request can be about (AccessNote::route). The access log prints these words
/// and the metrics count by them, so one that has been released stays. docs/watching.md and
/// velksharing-web(8) list them.
inline constexpr std::string_view kRouteNames[] = {
    "page",     "folder", "file",   "download", "view",  "thumbnail", "zip",
    "redirect", "login",  "logout", "auth",     "asset", "health",
    "none",  ///< Nothing that is there, or no request that could be read.
};

}  // namespace web

#endif
