#include "share/jpeg_reader.h"

#include <algorithm>
#include <bit>
#include <csetjmp>
#include <cstdio>

// Expects <cstdio> before it.
#include <jpeglib.h>

namespace web::share {
namespace {

constexpr unsigned int kLargestReduction = 8;
constexpr int kOpaque = 0x00FFFFFF;

// The library's colours in the order of bytes that an image of gd has in memory.
constexpr J_COLOR_SPACE kColours =
    std::endian::native == std::endian::little ? JCS_EXT_BGRX : JCS_EXT_XRGB;

/// What has to be given back, also after an error has jumped out of the library.
struct Reading {
  jpeg_decompress_struct jpeg;
  jpeg_error_mgr errors;
  jmp_buf on_error;
  gdImagePtr image;
};

void LeaveWithError(j_common_ptr jpeg) {
  longjmp(static_cast<Reading *>(jpeg->client_data)->on_error, 1);
}

void KeepSilent(j_common_ptr, int) {}

unsigned int Reduction(unsigned int longer, unsigned int side) {
  unsigned int reduction = 1;
  while (reduction < kLargestReduction && longer / (2 * reduction) >= side) reduction *= 2;
  return reduction;
}

void ReadLine(Reading &reading) {
  int *const line = reading.image->tpixels[reading.jpeg.output_scanline];
  JSAMPROW bytes = reinterpret_cast<JSAMPROW>(line);
  jpeg_read_scanlines(&reading.jpeg, &bytes, 1);
  std::for_each(line, line + reading.image->sx, [](int &pixel) { pixel &= kOpaque; });
}

void ReadLines(Reading &reading, std::string_view bytes, int side) {
  jpeg_decompress_struct &jpeg = reading.jpeg;
  jpeg_create_decompress(&jpeg);
  jpeg_mem_src(&jpeg, reinterpret_cast<const unsigned char *>(bytes.data()), bytes.size());
  jpeg_read_header(&jpeg, TRUE);
  jpeg.scale_num = 1;
  jpeg.scale_denom =
      Reduction(std::max(jpeg.image_width, jpeg.image_height), static_cast<unsigned int>(side));
  jpeg.out_color_space = kColours;
  jpeg_start_decompress(&jpeg);
  reading.image = gdImageCreateTrueColor(static_cast<int>(jpeg.output_width),
                                         static_cast<int>(jpeg.output_height));
  if (reading.image == nullptr) return;
  while (jpeg.output_scanline < jpeg.output_height) ReadLine(reading);
}

}  // namespace

gdImagePtr ReadJpeg(std::string_view jpeg, int side) {
  Reading reading = {};
  reading.jpeg.err = jpeg_std_error(&reading.errors);
  reading.jpeg.client_data = &reading;
  reading.errors.error_exit = LeaveWithError;
  reading.errors.emit_message = KeepSilent;
  if (setjmp(reading.on_error) == 0) {
    ReadLines(reading, jpeg, side);
  } else if (reading.image != nullptr) {
    gdImageDestroy(reading.image);
    reading.image = nullptr;
  }
  jpeg_destroy_decompress(&reading.jpeg);
  return reading.image;
}

}  // namespace web::share
