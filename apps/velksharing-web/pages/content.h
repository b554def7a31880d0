#ifndef VELKSHARING_WEB_PAGES_CONTENT_H
#define VELKSHARING_WEB_PAGES_CONTENT_H

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "pages/assets.h"
#include "pages/catalogue.h"
#include "pages/site_folder.h"
#include "pages/templates.h"

namespace web {

/// What pages are made from: templates, texts and assets, built in and the site's own over them.
/// Does not change once it is made.
class Content {
 public:
  /// @param site the site's own files; what it lacks is as it is built in.
  /// @param[out] error which file cannot be used, and why; one line.
  /// @return null on failure; never for an empty `site`.
  static std::unique_ptr<const Content> Make(const SourceFiles &site, std::string &error);

  /// The texts of a language; English ones when it is not known.
  const Catalogue &Texts(std::string_view language) const;
  /// The same for templates: an object named "t", and the language as "language".
  const Data &TextData(std::string_view language) const;
  /// English first.
  const std::vector<std::string> &languages() const { return languages_; }

  const Templates &templates() const { return templates_; }
  const Assets &assets() const { return assets_; }
  /// The name of an asset by its file's: "style.css" → "style-….css"; "" when there is none. The
  /// site's are "site.css" and "logo".
  std::string AssetName(std::string_view file_name) const;

 private:
  struct Language {
    Catalogue texts;
    Data data;
  };

  Content() = default;
  bool AddCatalogues(const SourceFiles &site, std::string &error);
  bool AddTemplates(const SourceFiles &site, std::string &error);
  void AddAssets(const SourceFiles &site);
  const Language &Find(std::string_view language) const;

  std::map<std::string, Language, std::less<>> by_language_;
  std::vector<std::string> languages_;
  Templates templates_;
  Assets assets_;
  std::map<std::string, std::string, std::less<>> asset_names_;
};

}  // namespace web

#endif
