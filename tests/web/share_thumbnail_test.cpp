#include "share/thumbnail.h"

#include <gd.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstdint>
#include <memory>
#include <ostream>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "share/sealed_child.h"
#include "share_support.h"
#include "support/temp_dir.h"

namespace {

using web::Request;
using web::Response;
using web::share::kThumbnailSide;
using web::share::MakeThumbnail;
using web::share::RunSealed;
using web::share::SealedLimits;
using web::share::ThumbnailResponse;
using web_test::SharedFolder;

struct ImageCloser {
  void operator()(gdImagePtr image) const { gdImageDestroy(image); }
};
using Image = std::unique_ptr<gdImage, ImageCloser>;
using Encoder = void *(*)(gdImagePtr, int *);

constexpr int kRed = 0xFF0000;
constexpr int kGreen = 0x00FF00;
constexpr int kBlue = 0x0000FF;
constexpr int kWhite = 0xFFFFFF;

void *EncodeJpeg(gdImagePtr image, int *size) {
  return gdImageJpegPtr(image, size, 95);
}

std::string Encoded(const Image &image, Encoder encoder) {
  int size = 0;
  void *const bytes = encoder(image.get(), &size);
  std::string encoded(static_cast<const char *>(bytes), static_cast<size_t>(size));
  gdFree(bytes);
  return encoded;
}

// Red, green, blue and white, from the upper left to the lower right.
Image FourColours(int width, int height) {
  Image image(gdImageCreateTrueColor(width, height));
  gdImageFilledRectangle(image.get(), 0, 0, width / 2, height / 2, kRed);
  gdImageFilledRectangle(image.get(), width / 2, 0, width, height / 2, kGreen);
  gdImageFilledRectangle(image.get(), 0, height / 2, width / 2, height, kBlue);
  gdImageFilledRectangle(image.get(), width / 2, height / 2, width, height, kWhite);
  return image;
}

std::optional<std::string> ThumbnailOf(const std::string &name, const std::string &content) {
  const SharedFolder folder;
  folder.AddFile(name, content);
  return MakeThumbnail(folder.Find({name}));
}

Image Decoded(const std::optional<std::string> &thumbnail) {
  std::string bytes = thumbnail.value();
  const int size = static_cast<int>(bytes.size());
  return Image(bytes[0] == '\x89' ? gdImageCreateFromPngPtr(size, bytes.data())
                                  : gdImageCreateFromJpegPtr(size, bytes.data()));
}

// The nearest of the four colours, as a letter; '-' for what shines through.
char ColourAt(const Image &image, int x, int y) {
  const int pixel = gdImageGetTrueColorPixel(image.get(), x, y);
  if (gdTrueColorGetAlpha(pixel) > gdAlphaMax / 2) return '-';
  const bool is_red = gdTrueColorGetRed(pixel) > 128;
  const bool is_green = gdTrueColorGetGreen(pixel) > 128;
  if (is_red && is_green) return 'w';
  if (is_red) return 'r';
  return is_green ? 'g' : 'b';
}

// The colours of its quarters: "rgbw" for one that stands as it was painted.
std::string Quarters(const Image &image) {
  const int left = gdImageSX(image.get()) / 4;
  const int right = gdImageSX(image.get()) * 3 / 4;
  const int upper = gdImageSY(image.get()) / 4;
  const int lower = gdImageSY(image.get()) * 3 / 4;
  return {ColourAt(image, left, upper), ColourAt(image, right, upper), ColourAt(image, left, lower),
          ColourAt(image, right, lower)};
}

// --- What becomes of an image -------------------------------------------------------------------

struct FormatCase {
  std::string name;
  Encoder encoder;
};

void PrintTo(const FormatCase &test_case, std::ostream *out) {
  *out << test_case.name;
}

class ShareThumbnailFormat : public testing::TestWithParam<FormatCase> {};

TEST_P(ShareThumbnailFormat, IsMadeSmallAndKeepsItsShape) {
  const auto thumbnail =
      ThumbnailOf(GetParam().name, Encoded(FourColours(1000, 500), GetParam().encoder));
  ASSERT_TRUE(thumbnail);
  const Image image = Decoded(thumbnail);
  ASSERT_TRUE(image);
  EXPECT_EQ(gdImageSX(image.get()), kThumbnailSide);
  EXPECT_EQ(gdImageSY(image.get()), kThumbnailSide / 2);
  EXPECT_EQ(Quarters(image), "rgbw");
}

INSTANTIATE_TEST_SUITE_P(ShareThumbnail, ShareThumbnailFormat,
                         testing::Values(FormatCase{"a.jpg", EncodeJpeg},
                                         FormatCase{"a.png", gdImagePngPtr},
                                         FormatCase{"a.gif", gdImageGifPtr},
                                         FormatCase{"a.webp", gdImageWebpPtr},
                                         // What it is tells its content, not its name.
                                         FormatCase{"png.jpg", gdImagePngPtr}));

TEST(ShareThumbnail, OfAnUprightImageIsUpright) {
  const Image image = Decoded(ThumbnailOf("a.png", Encoded(FourColours(500, 1000), gdImagePngPtr)));
  EXPECT_EQ(gdImageSX(image.get()), kThumbnailSide / 2);
  EXPECT_EQ(gdImageSY(image.get()), kThumbnailSide);
}

TEST(ShareThumbnail, OfASmallImageIsNotLarger) {
  const Image image = Decoded(ThumbnailOf("a.png", Encoded(FourColours(20, 10), gdImagePngPtr)));
  EXPECT_EQ(gdImageSX(image.get()), 20);
  EXPECT_EQ(gdImageSY(image.get()), 10);
}

TEST(ShareThumbnail, OfAThinImageHasAtLeastOnePixel) {
  const Image image = Decoded(ThumbnailOf("a.png", Encoded(FourColours(3000, 2), gdImagePngPtr)));
  EXPECT_EQ(gdImageSX(image.get()), kThumbnailSide);
  EXPECT_EQ(gdImageSY(image.get()), 1);
}

TEST(ShareThumbnail, OfALargePhotoIsMade) {
  const Image image = Decoded(ThumbnailOf("a.jpg", Encoded(FourColours(4000, 3000), EncodeJpeg)));
  EXPECT_EQ(gdImageSX(image.get()), kThumbnailSide);
  EXPECT_EQ(gdImageSY(image.get()), kThumbnailSide * 3 / 4);
  EXPECT_EQ(Quarters(image), "rgbw");
}

TEST(ShareThumbnail, KeepsWhatShinesThrough) {
  Image image(gdImageCreateTrueColor(400, 400));
  gdImageAlphaBlending(image.get(), 0);
  gdImageSaveAlpha(image.get(), 1);
  gdImageFilledRectangle(image.get(), 0, 0, 400, 400, gdTrueColorAlpha(0, 0, 0, gdAlphaMax));
  gdImageFilledRectangle(image.get(), 0, 0, 200, 200, kRed);
  const auto thumbnail = ThumbnailOf("a.png", Encoded(image, gdImagePngPtr));
  ASSERT_TRUE(thumbnail);
  EXPECT_EQ(thumbnail->substr(1, 3), "PNG");
  EXPECT_EQ(Quarters(Decoded(thumbnail)), "r---");
}

TEST(ShareThumbnail, IsAJpegWhereNothingShinesThrough) {
  const auto thumbnail = ThumbnailOf("a.png", Encoded(FourColours(400, 400), gdImagePngPtr));
  EXPECT_EQ(thumbnail->substr(0, 2), "\xFF\xD8");
}

// --- How the camera was held --------------------------------------------------------------------

enum class Endian { BIG, LITTLE };

std::string Number(uint32_t number, int width, Endian endian) {
  std::string bytes;
  for (int index = 0; index < width; ++index) {
    const int shift = 8 * (endian == Endian::BIG ? width - 1 - index : index);
    bytes += static_cast<char>(number >> shift & 0xFF);
  }
  return bytes;
}

// A segment of Exif that tells the orientation after something else.
std::string ExifSegment(int orientation, Endian endian, uint32_t directory = 8) {
  const auto number = [&](uint32_t value, int width) { return Number(value, width, endian); };
  const std::string tiff = (endian == Endian::BIG ? "MM" : "II") + number(42, 2) +
                           number(directory, 4) + number(2, 2) +  //
                           number(0x0100, 2) + number(4, 2) + number(1, 4) + number(1000, 4) +
                           number(0x0112, 2) + number(3, 2) + number(1, 4) +
                           number(static_cast<uint32_t>(orientation), 2) + number(0, 2) +
                           number(0, 4);
  const std::string payload = std::string("Exif\0\0", 6) + tiff;
  return "\xFF\xE1" + Number(static_cast<uint32_t>(payload.size() + 2), 2, Endian::BIG) + payload;
}

std::string WithExif(std::string jpeg, const std::string &segment) {
  return jpeg.insert(2, segment);
}

struct OrientationCase {
  int orientation;
  std::string quarters;
  bool is_swapped;
};

void PrintTo(const OrientationCase &test_case, std::ostream *out) {
  *out << test_case.orientation;
}

class ShareThumbnailOrientation : public testing::TestWithParam<OrientationCase> {};

TEST_P(ShareThumbnailOrientation, IsTurnedUpright) {
  for (const Endian endian : {Endian::BIG, Endian::LITTLE}) {
    const std::string jpeg = WithExif(Encoded(FourColours(800, 400), EncodeJpeg),
                                      ExifSegment(GetParam().orientation, endian));
    const auto thumbnail = ThumbnailOf("a.jpg", jpeg);
    ASSERT_TRUE(thumbnail);
    const Image image = Decoded(thumbnail);
    EXPECT_EQ(Quarters(image), GetParam().quarters);
    EXPECT_EQ(gdImageSX(image.get()) < gdImageSY(image.get()), GetParam().is_swapped);
  }
}

INSTANTIATE_TEST_SUITE_P(
    ShareThumbnail, ShareThumbnailOrientation,
    testing::Values(OrientationCase{0, "rgbw", false}, OrientationCase{1, "rgbw", false},
                    OrientationCase{2, "grwb", false}, OrientationCase{3, "wbgr", false},
                    OrientationCase{4, "bwrg", false}, OrientationCase{5, "rbgw", true},
                    OrientationCase{6, "brwg", true}, OrientationCase{7, "wgbr", true},
                    OrientationCase{8, "gwrb", true}, OrientationCase{9, "rgbw", false}));

TEST(ShareThumbnail, TakesBrokenExifForNone) {
  const std::string jpeg = Encoded(FourColours(800, 400), EncodeJpeg);
  const std::string segment = ExifSegment(6, Endian::BIG);
  for (const std::string &broken :
       {ExifSegment(6, Endian::BIG, 0xFFFFFFFF), ExifSegment(6, Endian::BIG, 30),
        ExifSegment(6, Endian::LITTLE, 0), std::string("\xFF\xE1\x00\x02", 4),
        std::string("\xFF\xE1\x00\x0A"
                    "Exif\0\0MM",
                    12)}) {
    const auto thumbnail = ThumbnailOf("a.jpg", WithExif(jpeg, broken));
    ASSERT_TRUE(thumbnail);
    EXPECT_EQ(Quarters(Decoded(thumbnail)), "rgbw");
  }
}

TEST(ShareThumbnail, TellsNothingThatTheImageTold) {
  const std::string comment = std::string("\xFF\xFE\x00\x0B", 4) + "secret ab";
  const auto thumbnail =
      ThumbnailOf("a.jpg", WithExif(Encoded(FourColours(800, 400), EncodeJpeg), comment));
  ASSERT_TRUE(thumbnail);
  EXPECT_EQ(thumbnail->find("secret"), std::string::npos);
}

// --- What is no image ---------------------------------------------------------------------------

class ShareThumbnailBroken : public testing::TestWithParam<std::pair<std::string, std::string>> {};

TEST_P(ShareThumbnailBroken, HasNone) {
  EXPECT_FALSE(ThumbnailOf(GetParam().first, GetParam().second));
}

INSTANTIATE_TEST_SUITE_P(
    ShareThumbnail, ShareThumbnailBroken,
    testing::Values(std::pair("a.png", "no image at all"), std::pair("a.jpg", "\xFF\xD8\xFF"),
                    std::pair("a.png", "\x89PNG\r\n"), std::pair("a.gif", "GIF89a"),
                    std::pair("a.webp", "RIFF0000WEBP"), std::pair("a.webp", "RIFF"),
                    std::pair("a.jpg", "\xFF\xD8\xFF\xE0"), std::pair("a.gif", "x"),
                    std::pair("a.txt", "text"), std::pair("a.png", "")));

TEST(ShareThumbnail, OfHalfAnImageDoesNotEndTheProcess) {
  for (const auto &[name, encoder] : {std::pair<std::string, Encoder>("a.jpg", EncodeJpeg),
                                      {"a.png", gdImagePngPtr},
                                      {"a.gif", gdImageGifPtr},
                                      {"a.webp", gdImageWebpPtr}}) {
    const std::string whole = Encoded(FourColours(300, 300), encoder);
    for (size_t length = 1; length < whole.size(); length += 1 + whole.size() / 20) {
      const auto thumbnail = ThumbnailOf(name, whole.substr(0, length));
      EXPECT_TRUE(!thumbnail || Decoded(thumbnail)) << name << " " << length;
    }
  }
}

uint32_t Checksum(const std::string &bytes) {
  uint32_t sum = 0xFFFFFFFF;
  for (const char byte : bytes) {
    sum ^= static_cast<unsigned char>(byte);
    for (int bit = 0; bit < 8; ++bit) sum = sum >> 1 ^ (sum & 1 ? 0xEDB88320 : 0);
  }
  return ~sum;
}

// A PNG's head, with a sum that is right, before the pixels of another.
std::string PngThatClaims(uint32_t width, uint32_t height) {
  std::string png = Encoded(FourColours(10, 10), gdImagePngPtr);
  png.replace(16, 8, Number(width, 4, Endian::BIG) + Number(height, 4, Endian::BIG));
  png.replace(29, 4, Number(Checksum(png.substr(12, 17)), 4, Endian::BIG));
  return png;
}

TEST(ShareThumbnail, AClaimOfItsRealSizeIsBelieved) {
  EXPECT_TRUE(ThumbnailOf("a.png", PngThatClaims(10, 10)));
}

TEST(ShareThumbnail, OfAnImageThatClaimsToBeHugeIsNotMade) {
  EXPECT_FALSE(ThumbnailOf("a.png", PngThatClaims(100'000, 100'000)));
  EXPECT_FALSE(ThumbnailOf("a.png", PngThatClaims(0x7FFFFFFF, 0x7FFFFFFF)));
  EXPECT_FALSE(ThumbnailOf("a.png", PngThatClaims(0, 0)));
  std::string gif = Encoded(FourColours(10, 10), gdImageGifPtr);
  gif.replace(6, 4, "\xFF\xFF\xFF\xFF");
  EXPECT_FALSE(ThumbnailOf("a.gif", gif));
}

TEST(ShareThumbnail, OfALargeFileIsNotMade) {
  const SharedFolder folder;
  folder.AddFile("a.jpg", Encoded(FourColours(10, 10), EncodeJpeg));
  ASSERT_EQ(truncate(folder.File("a.jpg").c_str(), 32 * 1024 * 1024 + 1), 0);
  EXPECT_FALSE(MakeThumbnail(folder.Find({"a.jpg"})));
}

TEST(ShareThumbnail, OfAFileThatShrinksMeanwhileIsNotMade) {
  const SharedFolder folder;
  folder.AddFile("a.jpg", Encoded(FourColours(10, 10), EncodeJpeg));
  const auto item = folder.Find({"a.jpg"});
  ASSERT_EQ(truncate(folder.File("a.jpg").c_str(), 10), 0);
  EXPECT_FALSE(MakeThumbnail(item));
}

TEST(ShareThumbnail, OfAFolderIsNotMade) {
  const SharedFolder folder;
  folder.AddFolder("a.jpg");
  EXPECT_FALSE(MakeThumbnail(folder.Find({"a.jpg"})));
}

// --- The answer ---------------------------------------------------------------------------------

TEST(ShareThumbnail, IsSentWithItsTypeAndTag) {
  const SharedFolder folder;
  folder.AddFile("a.png", Encoded(FourColours(400, 400), gdImagePngPtr));
  const auto response = ThumbnailResponse(folder.Find({"a.png"}), Request());
  ASSERT_TRUE(response);
  EXPECT_EQ(response->status, 200);
  EXPECT_EQ(response->headers.Get("Content-Type"), "image/jpeg");
  EXPECT_EQ(std::get<std::string>(response->body).substr(0, 2), "\xFF\xD8");
  EXPECT_NE(response->headers.Find("ETag"), nullptr);
}

TEST(ShareThumbnail, IsNotSentToWhoHasIt) {
  const SharedFolder folder;
  folder.AddFile("a.png", Encoded(FourColours(400, 400), gdImagePngPtr));
  Request request;
  request.headers.Add(
      "If-None-Match",
      std::string(ThumbnailResponse(folder.Find({"a.png"}), {})->headers.Get("ETag")));
  const auto response = ThumbnailResponse(folder.Find({"a.png"}), request);
  ASSERT_TRUE(response);
  EXPECT_EQ(response->status, 304);
  EXPECT_EQ(std::get<std::string>(response->body), "");
}

TEST(ShareThumbnail, OfNoImageHasNoAnswer) {
  const SharedFolder folder;
  folder.AddFile("a.png", "no image");
  EXPECT_FALSE(ThumbnailResponse(folder.Find({"a.png"}), Request()));
}

// --- The process that makes it ------------------------------------------------------------------

constexpr SealedLimits kLimits = {64 * 1024 * 1024, 1, 1000};

// What `work` finds in the child: "yes" or "no".
std::string InChild(const std::function<bool()> &work) {
  return RunSealed(kLimits, [&] { return std::string(work() ? "yes" : "no"); }).value_or("ended");
}

TEST(ShareSealedChild, GivesWhatItHasMade) {
  EXPECT_EQ(RunSealed(kLimits, [] { return std::string("made"); }), "made");
}

TEST(ShareSealedChild, GivesNothingForNothing) {
  EXPECT_FALSE(RunSealed(kLimits, [] { return std::string(); }));
}

TEST(ShareSealedChild, GivesNothingWhenItCrashes) {
  EXPECT_FALSE(RunSealed(kLimits, []() -> std::string {
    raise(SIGKILL);
    abort();
  }));
}

TEST(ShareSealedChild, GivesNothingWhenItThrows) {
  EXPECT_FALSE(RunSealed(kLimits, []() -> std::string { throw std::runtime_error("no"); }));
}

TEST(ShareSealedChild, GivesNothingWhenItMakesTooMuch) {
  EXPECT_FALSE(RunSealed(kLimits, [] { return std::string(100'000, 'a'); }));
}

TEST(ShareSealedChild, IsEndedWhenItGoesOnForEver) {
  EXPECT_FALSE(RunSealed(kLimits, []() -> std::string {
    std::atomic<bool> goes_on = true;
    while (goes_on) continue;
    return "ended";
  }));
}

TEST(ShareSealedChild, OpensNothing) {
  EXPECT_EQ(InChild([] { return fopen("/etc/passwd", "r") != nullptr; }), "no");
}

TEST(ShareSealedChild, HasNoDescriptorButTheOneForItsResult) {
  const web::UniqueFd file(dup(0));
  EXPECT_EQ(InChild([] {
              int writable = 0;
              for (int fd = 0; fd < 1000; ++fd) writable += write(fd, "", 0) == 0 ? 1 : 0;
              return writable == 1;
            }),
            "yes");
}

TEST(ShareSealedChild, StartsNoProcess) {
  EXPECT_EQ(InChild([] { return fork() >= 0; }), "no");
}

TEST(ShareSealedChild, SignalsNoProcess) {
  const pid_t parent = getpid();
  EXPECT_EQ(InChild([&] { return kill(parent, 0) == 0; }), "no");
}

TEST(ShareSealedChild, HasNoMemoryWithoutEnd) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
  GTEST_SKIP() << "the sanitizer needs the address space";
#endif
  EXPECT_EQ(InChild([] {
              return std::unique_ptr<void, void (*)(void *)>(malloc(80 * 1024 * 1024), free) !=
                     nullptr;
            }),
            "no");
}

TEST(ShareSealedChild, LeavesNoChildBehind) {
  RunSealed(kLimits, [] { return std::string("made"); });
  EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1);
}

}  // namespace
