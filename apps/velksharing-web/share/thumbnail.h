#ifndef VELKSHARING_WEB_SHARE_THUMBNAIL_H
#define VELKSHARING_WEB_SHARE_THUMBNAIL_H

#include <optional>
#include <string>

#include "http/request.h"
#include "http/response.h"
#include "share/item.h"

namespace web::share {

/// Neither side of a thumbnail is longer, in pixels.
constexpr int kThumbnailSide = 320;

/// A small picture of an image, turned upright, without anything else that the image told (place,
/// camera). Takes a while: a process of its own reads the image, for images come from strangers.
/// @return a JPEG, or a PNG where the image has transparent parts; nothing for what is no image
///         (JPEG, PNG, GIF, WebP), is broken, or is too large to be worth it.
std::optional<std::string> MakeThumbnail(const Item &image);

/// Answers GET or HEAD for the thumbnail of an image: 200, or 304 to a visitor who has it, for
/// which nothing is made.
/// @return nothing where MakeThumbnail() gives nothing.
std::optional<Response> ThumbnailResponse(const Item &image, const Request &request);

}  // namespace web::share

#endif
