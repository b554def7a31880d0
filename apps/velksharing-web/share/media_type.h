#ifndef VELKSHARING_WEB_SHARE_MEDIA_TYPE_H
#define VELKSHARING_WEB_SHARE_MEDIA_TYPE_H

#include <string>
#include <string_view>

namespace web::share {

/// The media type that the system's database (/etc/mime.types) gives a file name by its ending;
/// "" for an unknown one. The database is read once per process.
const std::string &MediaTypeByName(std::string_view name);

/// Whether a browser may show this type by itself: it executes nothing that such a file holds.
bool IsShownInline(std::string_view media_type);

/// Whether files of this type are compressed already.
bool IsCompressed(std::string_view media_type);

}  // namespace web::share

#endif
