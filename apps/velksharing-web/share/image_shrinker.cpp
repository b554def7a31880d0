#include "share/image_shrinker.h"

#include <gd.h>

#include <algorithm>
#include <cstdarg>
#include <cstdint>
#include <memory>

#include "share/exif_orientation.h"
#include "share/jpeg_reader.h"

namespace web::share {
namespace {

constexpr uint64_t kMostPixels = 70'000'000;
constexpr int kJpegQuality = 80;
constexpr int kPngLevel = 6;

struct ImageCloser {
  void operator()(gdImagePtr image) const { gdImageDestroy(image); }
};
using Image = std::unique_ptr<gdImage, ImageCloser>;

void KeepSilent(int, const char *, va_list) {}

bool IsJpeg(std::string_view bytes) {
  return bytes.starts_with("\xFF\xD8\xFF");
}

bool IsPng(std::string_view bytes) {
  return bytes.starts_with("\x89PNG\r\n");
}

bool IsGif(std::string_view bytes) {
  return bytes.starts_with("GIF8");
}

// A number of `width` bytes; 0 when there are not so many.
uint64_t Number(std::string_view bytes, size_t place, size_t width, bool is_big_endian) {
  if (bytes.size() < place + width) return 0;
  uint64_t number = 0;
  for (size_t index = 0; index < width; ++index) {
    const size_t from = is_big_endian ? place + index : place + width - 1 - index;
    number = number << 8 | static_cast<unsigned char>(bytes[from]);
  }
  return number;
}

// A few bytes can announce an image that takes all memory. The other formats have limits of their
// own.
bool IsTooLarge(std::string_view bytes) {
  if (IsPng(bytes)) return Number(bytes, 16, 4, true) * Number(bytes, 20, 4, true) > kMostPixels;
  if (IsGif(bytes)) return Number(bytes, 6, 2, false) * Number(bytes, 8, 2, false) > kMostPixels;
  return false;
}

// gd knows colours that we do not.
Image OpenJpeg(std::string_view bytes, int side) {
  if (gdImagePtr image = ReadJpeg(bytes, side)) return Image(image);
  return Image(
      gdImageCreateFromJpegPtr(static_cast<int>(bytes.size()), const_cast<char *>(bytes.data())));
}

Image Open(std::string_view bytes, int side) {
  const int size = static_cast<int>(bytes.size());
  void *const data = const_cast<char *>(bytes.data());
  if (IsJpeg(bytes)) return OpenJpeg(bytes, side);
  if (IsPng(bytes)) return Image(gdImageCreateFromPngPtr(size, data));
  if (IsGif(bytes)) return Image(gdImageCreateFromGifPtr(size, data));
  if (bytes.starts_with("RIFF") && bytes.size() > 12 && bytes.substr(8, 4) == "WEBP") {
    return Image(gdImageCreateFromWebpPtr(size, data));
  }
  return nullptr;
}

Image Canvas(int width, int height) {
  Image image(gdImageCreateTrueColor(width, height));
  if (!image) return nullptr;
  // Copies what shines through instead of painting it over black.
  gdImageAlphaBlending(image.get(), 0);
  gdImageSaveAlpha(image.get(), 1);
  return image;
}

Image Shrink(const Image &image, int side) {
  const int width = gdImageSX(image.get());
  const int height = gdImageSY(image.get());
  const int longer = std::max({width, height, side});
  const auto shrunk = [&](int length) {
    return std::max(1, static_cast<int>(static_cast<long>(length) * side / longer));
  };
  Image small = Canvas(shrunk(width), shrunk(height));
  if (!small) return nullptr;
  gdImageCopyResampled(small.get(), image.get(), 0, 0, 0, 0, gdImageSX(small.get()),
                       gdImageSY(small.get()), width, height);
  return small;
}

// Exif's numbers are made of three: whether the sides are swapped, and which ones are mirrored.
Image Upright(Image image, int orientation) {
  const bool is_swapped = orientation >= 5;
  const bool is_mirrored =
      orientation == 2 || orientation == 3 || orientation == 7 || orientation == 8;
  const bool is_upside_down =
      orientation == 3 || orientation == 4 || orientation == 6 || orientation == 7;
  if (orientation == 1) return image;
  const int width = gdImageSX(image.get());
  const int height = gdImageSY(image.get());
  Image turned = is_swapped ? Canvas(height, width) : Canvas(width, height);
  if (!turned) return nullptr;
  for (int y = 0; y < gdImageSY(turned.get()); ++y) {
    for (int x = 0; x < gdImageSX(turned.get()); ++x) {
      const int across = is_swapped ? y : x;
      const int down = is_swapped ? x : y;
      turned->tpixels[y][x] = image->tpixels[is_upside_down ? height - 1 - down : down]
                                            [is_mirrored ? width - 1 - across : across];
    }
  }
  return turned;
}

bool IsOpaque(const Image &image) {
  return std::all_of(image->tpixels, image->tpixels + image->sy, [&](const int *line) {
    return std::all_of(line, line + image->sx,
                       [](int pixel) { return gdTrueColorGetAlpha(pixel) == gdAlphaOpaque; });
  });
}

std::string Encode(const Image &image) {
  int size = 0;
  void *const bytes = IsOpaque(image) ? gdImageJpegPtr(image.get(), &size, kJpegQuality)
                                      : gdImagePngPtrEx(image.get(), &size, kPngLevel);
  if (bytes == nullptr) return "";
  std::string encoded(static_cast<const char *>(bytes), static_cast<size_t>(size));
  gdFree(bytes);
  return encoded;
}

}  // namespace

std::string ShrinkImage(std::string_view bytes, int side) {
  gdSetErrorMethod(KeepSilent);
  const Image image = IsTooLarge(bytes) ? nullptr : Open(bytes, side);
  if (!image) return "";
  Image small = Shrink(image, side);
  if (small && IsJpeg(bytes)) small = Upright(std::move(small), ExifOrientation(bytes));
  return small ? Encode(small) : "";
}

}  // namespace web::share
