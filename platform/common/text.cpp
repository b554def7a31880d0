#include "common/text.h"

namespace velk {

std::string_view Trim(std::string_view text, std::string_view blanks) {
  const size_t first = text.find_first_not_of(blanks);
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

bool CopyText(std::string_view text, char *out, size_t capacity) {
  if (out == nullptr || text.size() >= capacity) return false;
  text.copy(out, text.size());
  out[text.size()] = '\0';
  return true;
}

}  // namespace velk
