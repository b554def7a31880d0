#ifndef VELKSHARING_WEB_SHARE_CONTENT_DISPOSITION_H
#define VELKSHARING_WEB_SHARE_CONTENT_DISPOSITION_H

#include <string>
#include <string_view>

namespace web::share {

/// The field's value for a file name of any bytes: in ASCII for every browser and, where that is
/// not the name, encoded beside it. Nothing in a name ends the value or begins another field.
///
///     attachment; filename="Gr__e.txt"; filename*=UTF-8''Gr%C3%BC%C3%9Fe.txt
///
/// @param kind "attachment" or "inline".
std::string ContentDisposition(std::string_view kind, std::string_view name);

}  // namespace web::share

#endif
