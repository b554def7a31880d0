#include "share/thumbnail.h"

#include <utility>

#include "share/conditions.h"
#include "share/image_shrinker.h"
#include "share/preview.h"
#include "share/sealed_child.h"

namespace web::share {
namespace {

// Enough for some 70 million pixels, and for a JPEG of any camera.
constexpr SealedLimits kLimits = {320 * 1024 * 1024, 4, 1024 * 1024};

const char *TypeOf(const std::string &thumbnail) {
  return thumbnail.compare(0, 1, "\x89") == 0 ? "image/png" : "image/jpeg";
}

// A thumbnail changes with its image, but is another thing.
Validators ThumbnailValidators(const Item &image) {
  Validators validators = ValidatorsOf(image);
  validators.tag.insert(validators.tag.size() - 1, "-thumbnail");
  return validators;
}

}  // namespace

std::optional<std::string> MakeThumbnail(const Item &image) {
  if (image.is_folder || !MayHaveThumbnail(image.name, image.size)) return std::nullopt;
  const std::optional<std::string> content = ReadStart(image, static_cast<size_t>(image.size));
  if (!content) return std::nullopt;
  return RunSealed(kLimits, [&] { return ShrinkImage(*content, kThumbnailSide); });
}

std::optional<Response> ThumbnailResponse(const Item &image, const Request &request) {
  if (image.is_folder || !MayHaveThumbnail(image.name, image.size)) return std::nullopt;
  const Validators validators = ThumbnailValidators(image);
  Response response;
  response.headers.Add("ETag", validators.tag);
  response.headers.Add("Cache-Control", "private, no-cache");
  switch (Weigh(request.headers, validators)) {
    case Verdict::NOT_MODIFIED:
      response.status = 304;
      return response;
    case Verdict::FAILED:
      response.status = 412;
      return response;
    case Verdict::SEND:
      break;
  }
  std::optional<std::string> thumbnail = MakeThumbnail(image);
  if (!thumbnail) return std::nullopt;
  response.headers.Add("Content-Type", TypeOf(*thumbnail));
  response.body = std::move(*thumbnail);
  return response;
}

}  // namespace web::share
