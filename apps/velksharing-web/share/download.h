#ifndef VELKSHARING_WEB_SHARE_DOWNLOAD_H
#define VELKSHARING_WEB_SHARE_DOWNLOAD_H

#include "http/request.h"
#include "http/response.h"
#include "share/item.h"

namespace web::share {

/// What the visitor wants to do with a file.
enum class Purpose {
  SAVE,  ///< Content-Disposition: attachment
  VIEW,  ///< inline, for types that no browser executes; the others as for SAVE.
};

/// Answers GET or HEAD for a file: 200, 206, 304, 412 or 416, with ETag, Last-Modified,
/// Accept-Ranges, Content-Type, Content-Disposition and Cache-Control. Several ranges at once get
/// the whole file. The body is a FileBody, also for HEAD; that of 304, 412 and 416 is "".
///
/// The answer brings its own Content-Security-Policy, made for a file that is not a page of ours;
/// whoever adds such headers to every answer leaves this one alone.
/// @param file not a folder. It gives its descriptor away.
Response Download(Item file, const Request &request, Purpose purpose);

}  // namespace web::share

#endif
