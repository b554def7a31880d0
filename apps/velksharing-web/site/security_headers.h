#ifndef VELKSHARING_WEB_SITE_SECURITY_HEADERS_H
#define VELKSHARING_WEB_SITE_SECURITY_HEADERS_H

#include "http/response.h"

namespace web {

/// Adds what every answer tells the browser to refuse, and leaves fields that are there already
/// alone: an answer may have its own Content-Security-Policy and Cache-Control. An answer that
/// says nothing about caching is not kept.
///
/// Takes every field away whose value could end the line, or hold a zero byte; the log names it.
void AddSecurityHeaders(Response &response);

}  // namespace web

#endif
