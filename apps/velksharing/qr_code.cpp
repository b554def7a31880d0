#include "qr_code.h"

#include <qrencode.h>
#include <unistd.h>

#include <cerrno>
#include <iostream>
#include <memory>

#include "operations/failure.h"

namespace command_line {
namespace {

using operations::Failure;

constexpr int kMargin = 4;  // modules

constexpr char kBlackOnWhite[] = "\x1b[38;5;16;48;5;231m";
constexpr char kUsualColours[] = "\x1b[0m";

/// Two modules in one character: a terminal's are twice as high as wide.
const char *HalfBlocks(bool upper_dark, bool lower_dark) {
  if (upper_dark) return lower_dark ? "█" : "▀";
  return lower_dark ? "▄" : " ";
}

std::string Line(const QrCode &code, int y) {
  std::string line;
  for (int x = -kMargin; x < code.width() + kMargin; ++x)
    line += HalfBlocks(code.IsDark(x, y), code.IsDark(x, y + 1));
  return line;
}

}  // namespace

QrCode::QrCode(const std::string &text) {
  const std::unique_ptr<QRcode, void (*)(QRcode *)> code(
      QRcode_encodeString8bit(text.c_str(), 0, QR_ECLEVEL_M), QRcode_free);
  if (!code && errno == ERANGE)
    throw Failure(Failure::REFUSED, "the URL is too long for a QR code");
  if (!code) throw operations::SystemFailure("the QR code could not be made");
  width_ = code->width;
  for (int i = 0; i < width_ * width_; ++i) dark_.push_back((code->data[i] & 1) != 0);
}

bool QrCode::IsDark(int x, int y) const {
  const bool inside = x >= 0 && y >= 0 && x < width_ && y < width_;
  return inside && dark_[static_cast<std::size_t>(y * width_ + x)];
}

void PrintQrCode(const QrCode &code) {
  const bool terminal = isatty(STDOUT_FILENO) == 1;
  for (int y = -kMargin; y < code.width() + kMargin; y += 2) {
    const std::string line = Line(code, y);
    std::cout << (terminal ? kBlackOnWhite + line + kUsualColours : line) << '\n';
  }
}

std::string QrCodeSvg(const QrCode &code) {
  const std::string side = std::to_string(code.width() + 2 * kMargin);
  std::string svg = "<svg xmlns=\"http://www.w3.org/2000/svg\" viewBox=\"0 0 " + side + " " + side +
                    "\" shape-rendering=\"crispEdges\">\n<path fill=\"#fff\" d=\"M0 0h" + side +
                    "v" + side + "H0z\"/>\n<path d=\"";
  for (int y = 0; y < code.width(); ++y) {
    for (int x = 0; x < code.width(); ++x) {
      if (!code.IsDark(x, y)) continue;
      svg += "M" + std::to_string(x + kMargin) + " " + std::to_string(y + kMargin) + "h1v1h-1z";
    }
  }
  return svg + "\"/>\n</svg>\n";
}

}  // namespace command_line
