#include <algorithm>
#include <cstring>

#include "velksharing/utils.h"

namespace VELK::sharing {

bool StringExplode(std::vector<std::string> &out, const std::string &text, const char *delimiter) {
  if (delimiter == nullptr || *delimiter == '\0') return false;
  const size_t width = std::strlen(delimiter);
  out.clear();
  size_t start = 0;
  while (start < text.size()) {
    const size_t end = std::min(text.find(delimiter, start), text.size());
    if (end > start) out.push_back(text.substr(start, end - start));
    start = end + width;
  }
  return true;
}

}  // namespace VELK::sharing
