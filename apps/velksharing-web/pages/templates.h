#ifndef VELKSHARING_WEB_PAGES_TEMPLATES_H
#define VELKSHARING_WEB_PAGES_TEMPLATES_H

#include <kainjow/mustache.hpp>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace web {

/// What a template shows: texts, flags, lists and objects by name.
using Data = kainjow::mustache::data;

/// Compiled Mustache templates by name. Not for two threads at once, const or not.
class Templates {
 public:
  /// Compiles a template, in the place of one of the same name.
  /// @param[out] error what is wrong with it; one line.
  bool Set(const std::string &name, const std::string &text, std::string &error);

  /// Fills the template of a name that was set. What `page` lacks is looked for in `common`.
  std::string Render(const std::string &name, const Data &page, const Data &common) const;

 private:
  std::map<std::string, std::unique_ptr<kainjow::mustache::mustache>> templates_;
};

/// The keys of the catalogue that a template uses, as {{t.KEY}}.
std::vector<std::string> TextKeysOf(std::string_view mustache);

}  // namespace web

#endif
