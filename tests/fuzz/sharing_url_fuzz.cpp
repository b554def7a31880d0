// Any bytes as the two lines of velksharingurl: what the library makes of them must be what cutting
// the text up gives.

#include <velksharing/utils.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "played_program.h"
#include "require.h"

namespace {

using velk_test::Require;

/// Takes the first line off `text`, or as much of it as `limit` bytes are.
std::string TakeLine(std::string &text, size_t limit) {
  const size_t end = text.find('\n');
  const size_t length = std::min(end == std::string::npos ? text.size() : end + 1, limit);
  std::string line = text.substr(0, length);
  text.erase(0, length);
  return line;
}

std::string UpToZeroByte(const std::string &text) {
  return text.substr(0, text.find('\0'));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  std::string rest(reinterpret_cast<const char *>(data), size);
  velk_test::PlayProgram(rest);
  const std::string url_line = TakeLine(rest, 4095);
  const std::string type_line = TakeLine(rest, 3);

  std::string url = "before";
  auto type = static_cast<VELK::sharing::_tag_SHARING_URL_TYPE>(77);
  const bool done = VELK::sharing::GetSharingURL("hash", 0, true, "", url, type);

  Require(done == !type_line.empty());
  if (url_line.empty()) {
    Require(url == "before");
  } else {
    Require(url == UpToZeroByte(url_line.substr(0, url_line.size() - 1)));
  }
  Require(type == (done ? atoi(type_line.c_str()) : 77));
  return 0;
}
