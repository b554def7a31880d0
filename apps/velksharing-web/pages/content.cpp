#include "pages/content.h"

#include <algorithm>
#include <utility>

#include "http/text.h"
#include "pages/embedded_files.h"

namespace web {
namespace {

constexpr std::string_view kEnglish = "en";
constexpr std::string_view kSiteKey = "site_";

using AllTexts = std::map<std::string, Catalogue::Texts>;

/// "folder" of "templates/folder.mustache"; "" when the name lies elsewhere.
std::string StemBetween(std::string_view name, std::string_view folder,
                        std::string_view extension) {
  if (name.size() <= folder.size() + extension.size()) return "";
  if (name.substr(0, folder.size()) != folder) return "";
  if (name.substr(name.size() - extension.size()) != extension) return "";
  return std::string(name.substr(folder.size(), name.size() - folder.size() - extension.size()));
}

std::string TemplateOf(std::string_view name) {
  return StemBetween(name, "templates/", ".mustache");
}

std::string LanguageOf(std::string_view name) {
  return StemBetween(name, "catalogues/", ".json");
}

/// Whether it may stand in the attribute `lang`: "de", "pt-BR".
bool IsLanguageTag(std::string_view text) {
  const bool is_plain = std::all_of(text.begin(), text.end(), [](char character) {
    return IsLetterOrDigit(character) || character == '-';
  });
  return is_plain && text.size() >= 2 && text.size() <= 35 && text[0] != '-';
}

AllTexts BuiltInTexts() {
  AllTexts all;
  std::string error;
  for (const EmbeddedFile &file : EmbeddedFiles()) {
    const std::string language = LanguageOf(file.name);
    if (!language.empty()) Catalogue::Read(file.content, all[language], error);
  }
  return all;
}

/// Puts a site's texts over those that there are. A key that is not known would never be shown.
bool AddSiteTexts(const SourceFiles &site, AllTexts &all, std::string &error) {
  const Catalogue::Texts known = all[std::string(kEnglish)];
  for (const auto &[name, content] : site) {
    const std::string language = LanguageOf(name);
    if (language.empty()) continue;
    error = "\"" + language + "\" is no language tag";
    Catalogue::Texts texts;
    if (!IsLanguageTag(language) || !Catalogue::Read(content, texts, error)) {
      error = name + ": " + error;
      return false;
    }
    for (auto &[key, text] : texts) {
      if (known.count(key) == 0 && key.substr(0, kSiteKey.size()) != kSiteKey) {
        error = name + ": unknown text \"" + key + "\"";
        return false;
      }
      all[language].insert_or_assign(key, std::move(text));
    }
  }
  error.clear();
  return true;
}

Data TextsAsData(const std::string &language, const Catalogue::Texts &texts) {
  Data by_key;
  for (const auto &[key, text] : texts) by_key.set(key, text);
  Data data;
  data.set("t", by_key);
  data.set("language", language);
  return data;
}

}  // namespace

std::unique_ptr<const Content> Content::Make(const SourceFiles &site, std::string &error) {
  std::unique_ptr<Content> content(new Content());
  if (!content->AddCatalogues(site, error) || !content->AddTemplates(site, error)) return nullptr;
  content->AddAssets(site);
  return content;
}

bool Content::AddCatalogues(const SourceFiles &site, std::string &error) {
  AllTexts all = BuiltInTexts();
  if (!AddSiteTexts(site, all, error)) return false;

  const Catalogue::Texts english = all[std::string(kEnglish)];
  languages_.emplace_back(kEnglish);
  for (auto &[language, texts] : all) {
    if (language != kEnglish) languages_.push_back(language);
    texts.insert(english.begin(), english.end());
    Data data = TextsAsData(language, texts);
    by_language_.emplace(language, Language{Catalogue(std::move(texts)), std::move(data)});
  }
  return true;
}

bool Content::AddTemplates(const SourceFiles &site, std::string &error) {
  std::map<std::string, std::string_view> texts;
  for (const EmbeddedFile &file : EmbeddedFiles()) {
    if (!TemplateOf(file.name).empty()) texts[std::string(file.name)] = file.content;
  }
  for (const auto &[name, content] : site) {
    if (TemplateOf(name).empty()) continue;
    if (texts.count(name) == 0) {
      error = name + ": there is no such page";
      return false;
    }
    texts[name] = content;
  }

  const Catalogue::Texts &known = Texts(kEnglish).texts();
  for (const auto &[name, text] : texts) {
    if (!templates_.Set(TemplateOf(name), std::string(text), error)) {
      error = name + ": " + error;
      return false;
    }
    for (const std::string &key : TextKeysOf(text)) {
      if (known.count(key) > 0) continue;
      error = name + ": unknown text \"" + key + "\"";
      return false;
    }
  }
  return true;
}

void Content::AddAssets(const SourceFiles &site) {
  const auto add = [this](std::string_view known_as, std::string_view file_name,
                          std::string_view bytes) {
    asset_names_.insert_or_assign(std::string(known_as),
                                  assets_.Add(file_name, std::string(bytes)));
  };
  constexpr std::string_view kFolder = "assets/";
  for (const EmbeddedFile &file : EmbeddedFiles()) {
    if (file.name.substr(0, kFolder.size()) != kFolder) continue;
    const std::string_view name = file.name.substr(kFolder.size());
    add(name, name, file.content);
  }
  if (const auto style = site.find("style.css"); style != site.end()) {
    add("site.css", "site.css", style->second);
  }
  for (const char *name : {"logo.png", "logo.svg"}) {
    if (const auto logo = site.find(name); logo != site.end()) add("logo", name, logo->second);
  }
}

const Catalogue &Content::Texts(std::string_view language) const {
  return Find(language).texts;
}

const Data &Content::TextData(std::string_view language) const {
  return Find(language).data;
}

std::string Content::AssetName(std::string_view file_name) const {
  const auto found = asset_names_.find(file_name);
  return found == asset_names_.end() ? "" : found->second;
}

const Content::Language &Content::Find(std::string_view language) const {
  const auto found = by_language_.find(language);
  return found != by_language_.end() ? found->second : by_language_.find(kEnglish)->second;
}

}  // namespace web
