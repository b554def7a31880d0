#include "gate/reading.h"

#include <utility>

#include "http/percent.h"
#include "http/text.h"

namespace web::gate {
namespace {

std::string EncodedComponent(std::string_view component) {
  std::string encoded;
  for (const char byte : component) {
    if (IsPlainInPath(byte)) {
      encoded += byte;
    } else {
      encoded += PercentEncode(std::string_view(&byte, 1));
    }
  }
  return encoded;
}

}  // namespace

Reading::Reading(std::string text) : text_(std::move(text)) {}

bool Reading::LiesBelow(const Reading &other) const {
  if (!text_.starts_with(other.text_)) return false;
  return text_.size() == other.text_.size() || text_[other.text_.size()] == kSeparator;
}

std::vector<std::string> Reading::components() const {
  std::vector<std::string> components;
  if (text_.empty()) return components;
  std::string_view rest = std::string_view(text_).substr(1);
  for (;;) {
    const size_t end = rest.find(kSeparator);
    components.emplace_back(rest.substr(0, end));
    if (end == std::string_view::npos) return components;
    rest.remove_prefix(end + 1);
  }
}

bool IsPlainInPath(char byte) {
  constexpr std::string_view kMarks = "-._~!$&'()*+,;=:@[]|";
  return IsLetterOrDigit(byte) || kMarks.find(byte) != std::string_view::npos;
}

std::string EncodedPath(const std::vector<std::string> &components) {
  if (components.empty()) return "/";
  std::string path;
  for (const std::string &component : components)
    path.append("/").append(EncodedComponent(component));
  return path;
}

}  // namespace web::gate
