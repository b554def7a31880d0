#ifndef VELKSHARING_WEB_SHARE_IMAGE_SHRINKER_H
#define VELKSHARING_WEB_SHARE_IMAGE_SHRINKER_H

#include <string>
#include <string_view>

namespace web::share {

/// Makes a small picture of an image, upright as Exif tells. Trusts its libraries with whatever the
/// bytes are, so it belongs into a process that has nothing to lose.
/// @param bytes a JPEG, PNG, GIF or WebP, told by how it begins.
/// @param side neither side gets longer, in pixels; a smaller image stays as large as it is.
/// @return a JPEG, or a PNG where something shines through; "" when it is none of these or broken.
std::string ShrinkImage(std::string_view bytes, int side);

}  // namespace web::share

#endif
