#ifndef VELKSHARING_CLI_QR_CODE_H
#define VELKSHARING_CLI_QR_CODE_H

#include <string>
#include <vector>

namespace command_line {

/// A QR code: a square of dark and light modules.
class QrCode {
 public:
  /// @param text up to 2331 bytes.
  /// @throws operations::Failure REFUSED for a longer text, SYSTEM when memory runs out.
  explicit QrCode(const std::string &text);

  /// Modules of a side.
  int width() const { return width_; }

  /// Light, too, is everything around the code.
  bool IsDark(int x, int y) const;

 private:
  int width_ = 0;
  std::vector<bool> dark_;  ///< Row by row.
};

/// On standard output, with the margin that readers need. A terminal gets it in black on white,
/// whatever its colours are; a file in characters, whose ink is the dark modules.
void PrintQrCode(const QrCode &code);

/// As a picture of one unit per module, margin included, to be scaled at will.
std::string QrCodeSvg(const QrCode &code);

}  // namespace command_line

#endif
