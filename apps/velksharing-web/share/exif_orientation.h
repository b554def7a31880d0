#ifndef VELKSHARING_WEB_SHARE_EXIF_ORIENTATION_H
#define VELKSHARING_WEB_SHARE_EXIF_ORIENTATION_H

#include <string_view>

namespace web::share {

/// How the camera was held, as a JPEG tells: 1 for upright, to 8 as Exif numbers them; 1 also
/// where it tells nothing, or nonsense. Takes any bytes.
int ExifOrientation(std::string_view jpeg);

}  // namespace web::share

#endif
