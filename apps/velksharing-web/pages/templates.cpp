#include "pages/templates.h"

#include <utility>

namespace web {

bool Templates::Set(const std::string &name, const std::string &text, std::string &error) {
  auto compiled = std::make_unique<kainjow::mustache::mustache>(text);
  if (!compiled->is_valid()) {
    error = compiled->error_message();
    return false;
  }
  templates_[name] = std::move(compiled);
  return true;
}

std::string Templates::Render(const std::string &name, const Data &page, const Data &common) const {
  kainjow::mustache::context<std::string> context(&common);
  context.push(&page);
  return templates_.at(name)->render(context);
}

std::vector<std::string> TextKeysOf(std::string_view mustache) {
  constexpr std::string_view kOpen = "{{";
  std::vector<std::string> keys;
  for (size_t at = mustache.find(kOpen); at != std::string_view::npos;
       at = mustache.find(kOpen, at)) {
    at = mustache.find_first_not_of("{#^/& ", at);
    const size_t end = mustache.find_first_of("} ", at);
    if (end == std::string_view::npos) break;
    const std::string_view name = mustache.substr(at, end - at);
    if (name.substr(0, 2) == "t.") keys.emplace_back(name.substr(2));
    at = end;
  }
  return keys;
}

}  // namespace web
