#include "share/exif_orientation.h"

#include <cstdint>
#include <optional>

namespace web::share {
namespace {

constexpr int kUpright = 1;
constexpr uint16_t kOrientationTag = 0x0112;
constexpr uint16_t kShortType = 3;
constexpr size_t kDirectoryEntrySize = 12;

/// Numbers at places of a text that may be too short for them.
class Numbers {
 public:
  Numbers(std::string_view bytes, bool is_big_endian)
      : bytes_(bytes), is_big_endian_(is_big_endian) {}

  std::optional<uint32_t> At(size_t place, size_t width) const {
    if (place > bytes_.size() || bytes_.size() - place < width) return std::nullopt;
    uint32_t number = 0;
    for (size_t index = 0; index < width; ++index) {
      const size_t from = is_big_endian_ ? place + index : place + width - 1 - index;
      number = number << 8 | static_cast<unsigned char>(bytes_[from]);
    }
    return number;
  }
  std::optional<uint32_t> Short(size_t place) const { return At(place, 2); }
  std::optional<uint32_t> Long(size_t place) const { return At(place, 4); }

 private:
  std::string_view bytes_;
  bool is_big_endian_;
};

// The TIFF structure in the segment that holds Exif data; "" when there is none.
std::string_view FindExif(std::string_view jpeg) {
  constexpr std::string_view kStart("\xFF\xD8", 2);
  constexpr std::string_view kExif("Exif\0\0", 6);
  constexpr uint32_t kExifSegment = 0xFFE1;
  if (!jpeg.starts_with(kStart)) return {};
  const Numbers numbers(jpeg, true);
  size_t place = kStart.size();
  while (true) {
    const std::optional<uint32_t> marker = numbers.Short(place);
    const std::optional<uint32_t> length = numbers.Short(place + 2);
    // Exif stands before the picture, among the segments of applications and comments.
    if (!marker || !length || *marker < 0xFFE0 || *length < 2) return {};
    const std::string_view segment = jpeg.substr(place + 4, *length - 2);
    if (*marker == kExifSegment && segment.starts_with(kExif)) {
      return segment.substr(kExif.size());
    }
    place += 2 + *length;
  }
}

std::optional<uint32_t> FindOrientation(const Numbers &numbers) {
  const std::optional<uint32_t> directory = numbers.Long(4);
  const std::optional<uint32_t> count = directory ? numbers.Short(*directory) : std::nullopt;
  for (uint32_t index = 0; count && index < *count; ++index) {
    const size_t entry = size_t{*directory} + 2 + index * kDirectoryEntrySize;
    const std::optional<uint32_t> tag = numbers.Short(entry);
    if (!tag) return std::nullopt;
    if (*tag != kOrientationTag) continue;
    return numbers.Short(entry + 2) == kShortType ? numbers.Short(entry + 8) : std::nullopt;
  }
  return std::nullopt;
}

}  // namespace

int ExifOrientation(std::string_view jpeg) {
  const std::string_view exif = FindExif(jpeg);
  const bool is_big_endian = exif.starts_with("MM");
  if (!is_big_endian && !exif.starts_with("II")) return kUpright;
  const uint32_t orientation = FindOrientation(Numbers(exif, is_big_endian)).value_or(kUpright);
  return orientation >= 1 && orientation <= 8 ? static_cast<int>(orientation) : kUpright;
}

}  // namespace web::share
