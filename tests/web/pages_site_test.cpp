// A site's own texts, colours, logo and templates, and what happens when they cannot be used.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>
#include <vector>

#include "pages/pages.h"
#include "support/temp_dir.h"

namespace web {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::StartsWith;

class SitePages : public ::testing::Test {
 protected:
  void Put(const std::string &name, const std::string &content) {
    const std::filesystem::path path = folder_.File(name);
    std::filesystem::create_directories(path.parent_path());
    velk_test::WriteFile(path, content);
  }

  void Load() {
    std::string error;
    ASSERT_TRUE(pages_.Reload(error)) << error;
  }

  std::string Page(const std::string &language = "en") const {
    return pages_.Password({language, "t"}, {.link = {.hash = "aB3xK9pQ2", .title = "Sun"}});
  }

  /// The asset that the page refers to by an attribute's value that holds `part`.
  const Asset *AssetOf(const std::string &page, const std::string &part) const {
    const std::string start = "/sharing/-/" + part;
    const size_t begin = page.find(start);
    if (begin == std::string::npos) return nullptr;
    const size_t name = begin + start.size() - part.size();
    return pages_.FindAsset(page.substr(name, page.find_first_of("\"#", name) - name));
  }

  velk_test::TempDir folder_;
  Pages pages_{{.site_folder = folder_.path()}};
};

TEST_F(SitePages, AreAsBuiltInForAnEmptyFolder) {
  const std::string before = Page();
  Load();
  EXPECT_EQ(before, Page());
}

TEST_F(SitePages, HaveTheSitesTextsAndTheBuiltInOnesBeside) {
  Put("catalogues/de.json", R"({"password_button": "Hinein"})");
  Load();
  EXPECT_THAT(Page("de"), HasSubstr(">Hinein</button>"));
  EXPECT_THAT(Page("de"), HasSubstr("Diese Freigabe ist mit einem Passwort"));
  EXPECT_THAT(Page("en"), HasSubstr(">Open</button>"));
}

TEST_F(SitePages, SpeakALanguageThatTheSiteAdds) {
  Put("catalogues/fr.json", R"({"password_button": "Ouvrir"})");
  EXPECT_EQ("en", pages_.ChooseLanguage("fr"));
  Load();
  EXPECT_EQ("fr", pages_.ChooseLanguage("fr-CH, de;q=0.5"));
  EXPECT_THAT(Page("fr"), HasSubstr("<html lang=\"fr\">"));
  EXPECT_THAT(Page("fr"), HasSubstr(">Ouvrir</button>"));
  EXPECT_THAT(Page("fr"), HasSubstr("A password protects what is shared here."));
}

TEST_F(SitePages, HaveTheSitesTemplatesWithTextsOfTheirOwn) {
  Put("templates/password.mustache", "<p>{{t.site_motto}} {{title}} {{t.password_label}}</p>");
  Put("catalogues/en.json", R"({"site_motto": "Share & care"})");
  Put("catalogues/de.json", R"({"site_motto": "Teilen"})");
  Load();
  EXPECT_THAT(Page("en"), HasSubstr("<p>Share &amp; care Sun Password</p>"));
  EXPECT_THAT(Page("de"), HasSubstr("<p>Teilen Sun Passwort</p>"));
  EXPECT_THAT(Page("en"), HasSubstr("<!DOCTYPE html>"));
}

TEST_F(SitePages, HaveTheSitesColoursBehindTheBuiltInOnes) {
  Put("style.css", ":root { --accent: #7a1f5c; }");
  Load();
  const std::string page = Page();
  EXPECT_LT(page.find("/sharing/-/style-"), page.find("/sharing/-/site-"));
  const Asset *style = AssetOf(page, "site-");
  ASSERT_NE(nullptr, style);
  EXPECT_EQ("text/css; charset=utf-8", style->type);
  EXPECT_EQ(":root { --accent: #7a1f5c; }", style->bytes);
}

TEST_F(SitePages, HaveTheSitesLogo) {
  Put("logo.png", "not looked at");
  Load();
  const Asset *logo = AssetOf(Page(), "logo-");
  ASSERT_NE(nullptr, logo);
  EXPECT_EQ("image/png", logo->type);

  Put("logo.svg", "<svg/>");
  Load();
  logo = AssetOf(Page(), "logo-");
  ASSERT_NE(nullptr, logo);
  EXPECT_EQ("image/svg+xml", logo->type);
}

TEST_F(SitePages, HaveAssetsOfAnotherNameWhenTheyChange) {
  Put("style.css", "a {}");
  Load();
  const std::string before = Page();
  EXPECT_NE(nullptr, AssetOf(before, "site-"));
  Put("style.css", "b {}");
  Load();
  EXPECT_EQ(nullptr, AssetOf(before, "site-"));
  EXPECT_NE(nullptr, AssetOf(Page(), "site-"));
}

TEST_F(SitePages, AreBuiltInAgainWhenTheSitesOwnAreGone) {
  const std::string before = Page();
  Put("templates/password.mustache", "mine");
  Load();
  EXPECT_NE(before, Page());
  std::filesystem::remove(folder_.File("templates/password.mustache"));
  Load();
  EXPECT_EQ(before, Page());
}

TEST_F(SitePages, LeaveOtherFilesAlone) {
  const std::string before = Page();
  Put("README", "x");
  Put("templates/password.mustache~", "{{#broken");
  Put("templates/.password.mustache", "{{#broken");
  Put("catalogues/notes.txt", "x");
  Load();
  EXPECT_EQ(before, Page());
}

TEST_F(SitePages, StayAsTheyAreWhenSomethingIsBroken) {
  Put("catalogues/en.json", R"({"password_button": "First"})");
  Load();
  const std::string before = Page();
  const std::vector<std::pair<std::string, std::string>> broken = {
      {"templates/password.mustache", "{{#title}} never closed"},
      {"templates/password.mustache", "{{title"},
      {"templates/password.mustache", "{{/title}}"},
      {"templates/password.mustache", "{{t.no_such_text}}"},
      {"templates/pasword.mustache", "a name that is mistyped"},
      {"catalogues/de.json", "{"},
      {"catalogues/de.json", "[]"},
      {"catalogues/de.json", R"({"password_button": 1})"},
      {"catalogues/de.json", R"({"pasword_button": "mistyped"})"},
      {"catalogues/d\" onload=\"x.json", "{}"},
      {"style.css", std::string(2 * 1024 * 1024, ' ')},
  };
  for (const auto &[name, content] : broken) {
    Put("catalogues/en.json", R"({"password_button": "Second"})");
    Put(name, content);
    std::string error;
    EXPECT_FALSE(pages_.Reload(error)) << name << ": " << content.substr(0, 40);
    EXPECT_THAT(error, StartsWith(folder_.path() + ": " + name + ": "));
    EXPECT_EQ(std::string::npos, error.find('\n')) << error;
    EXPECT_EQ(before, Page()) << name;
    std::filesystem::remove(folder_.File(name));
  }
  Load();
  EXPECT_THAT(Page(), HasSubstr(">Second</button>"));
}

TEST_F(SitePages, DoNotWaitForANamedPipe) {
  ASSERT_EQ(0, mkfifo(folder_.File("style.css").c_str(), 0600));
  std::string error;
  EXPECT_FALSE(pages_.Reload(error));
  EXPECT_THAT(error, HasSubstr("style.css: not a regular file"));
}

TEST_F(SitePages, TellThatTheFolderIsMissing) {
  Pages pages({.site_folder = folder_.File("missing")});
  std::string error;
  EXPECT_FALSE(pages.Reload(error));
  EXPECT_EQ(folder_.File("missing") + ": No such file or directory", error);
}

TEST(PagesWithoutSite, ReloadAtOnce) {
  Pages pages({});
  std::string error;
  EXPECT_TRUE(pages.Reload(error));
  EXPECT_EQ("", error);
}

TEST(PagesOfAProduct, BearItsName) {
  const Pages pages({.base_path = "/s", .product_name = "Kiosk & Co"});
  const std::string page = pages.Message({"en", ""}, 404);
  EXPECT_THAT(page, HasSubstr("<span>Kiosk &amp; Co</span>"));
  EXPECT_THAT(page, HasSubstr(" · Kiosk &amp; Co</title>"));
  EXPECT_THAT(page, HasSubstr("href=\"/s/-/style-"));
  EXPECT_THAT(page, Not(HasSubstr("/sharing")));
}

TEST(Assets, AreFoundByTheirWholeNameOnly) {
  const Pages pages({});
  for (const char *name : {"", "style.css", "style-.css", "../style.css", "favicon.svg"}) {
    EXPECT_EQ(nullptr, pages.FindAsset(name)) << name;
  }
}

}  // namespace
}  // namespace web
