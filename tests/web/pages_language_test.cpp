// Languages: which one a visitor gets, its texts, and how it writes numbers and times.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <map>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "pages/catalogue.h"
#include "pages/embedded_files.h"
#include "pages/language_choice.h"
#include "pages/templates.h"

namespace web {
namespace {

using ::testing::ElementsAre;

std::string_view Embedded(std::string_view name) {
  for (const EmbeddedFile &file : EmbeddedFiles()) {
    if (file.name == name) return file.content;
  }
  ADD_FAILURE() << name << " is not part of the program";
  return "";
}

Catalogue::Texts TextsOf(const std::string &language) {
  Catalogue::Texts texts;
  std::string error;
  EXPECT_TRUE(Catalogue::Read(Embedded("catalogues/" + language + ".json"), texts, error)) << error;
  return texts;
}

std::set<std::string> PlacesOf(const std::string &text) {
  static const std::regex place("\\{[^}]*\\}");
  return {std::sregex_token_iterator(text.begin(), text.end(), place),
          std::sregex_token_iterator()};
}

TEST(LanguageChoice, FollowsTheField) {
  const std::vector<std::string> offered = {"en", "de", "pt-BR"};
  const std::vector<std::pair<std::string, std::string>> table = {
      {"", "en"},
      {"de", "de"},
      {"DE", "de"},
      {"de-CH", "de"},
      {"de-CH-1996", "de"},
      {"pt", "pt-BR"},
      {"pt-PT", "en"},
      {"fr", "en"},
      {"fr, de", "de"},
      {"fr;q=0.9, de;q=0.1", "de"},
      {"en;q=0.8, de;q=0.9", "de"},
      {"de;q=0.8, en;q=0.9", "en"},
      {"de, en", "de"},
      {"en, de", "en"},
      {"de;q=0", "en"},
      {"*", "en"},
      {"*, en;q=0", "de"},
      {"de;q=0.5, *", "en"},
      {"en;q=0", "en"},
      {" de ; q=1.000 ", "de"},
      {"de;level=1;q=0.3, en;q=0.2", "de"},
      {"de;q=2, en;q=0.1", "en"},
      {"de;q=, en;q=0.1", "en"},
      {"de;q=0.1234, en;q=0.1", "en"},
      {"de;q=nan, en;q=0.1", "en"},
      {"de;q=1.001, en;q=0.1", "en"},
      {"de;q=0.-1, en;q=0.1", "en"},
      {",,;;=,q=1,,de", "de"},
      {"deu", "en"},
      {"d", "en"},
      {std::string("de\0", 3), "en"},
      {std::string(20000, ','), "en"},
  };
  for (const auto &[field, language] : table) {
    EXPECT_EQ(language, ChooseAmong(offered, field)) << "\"" << field << "\"";
  }
}

TEST(Catalogues, HaveTheSameKeys) {
  const Catalogue::Texts english = TextsOf("en");
  const Catalogue::Texts german = TextsOf("de");
  for (const auto &text : english) EXPECT_EQ(1u, german.count(text.first)) << text.first;
  for (const auto &text : german) EXPECT_EQ(1u, english.count(text.first)) << text.first;
}

TEST(Catalogues, HaveTheSamePlacesInEachText) {
  const Catalogue::Texts german = TextsOf("de");
  for (const auto &[key, text] : TextsOf("en")) {
    if (key == "format_time") continue;
    EXPECT_EQ(PlacesOf(text), PlacesOf(german.at(key))) << key;
  }
}

TEST(Catalogues, HaveNoEmptyText) {
  for (const char *language : {"en", "de"}) {
    for (const auto &[key, text] : TextsOf(language)) EXPECT_NE("", text) << language << " " << key;
  }
}

TEST(Catalogues, HaveEveryKeyOfTheTemplates) {
  const Catalogue::Texts english = TextsOf("en");
  size_t count = 0;
  for (const EmbeddedFile &file : EmbeddedFiles()) {
    if (file.name.substr(0, 10) != "templates/") continue;
    for (const std::string &key : TextKeysOf(file.content)) {
      EXPECT_EQ(1u, english.count(key)) << file.name << ": " << key;
      ++count;
    }
  }
  EXPECT_GT(count, 20u);
}

TEST(Templates, TellTheKeysThatTheyUse) {
  EXPECT_THAT(TextKeysOf("{{t.a}} {{title}} {{#t.b}}{{&t.c}}{{{ t.d }}}{{/t.b}} {{^t.e}} t.f {{"),
              ElementsAre("a", "b", "c", "d", "b", "e"));
}

TEST(Catalogue, RefusesWhatIsNoObjectOfTexts) {
  for (const char *json : {"", "{", "[]", "\"text\"", "null", R"({"a":1})", R"({"a":{"b":"c"}})",
                           R"({"a":"b"} x)", R"({"a":"b","a":"c"})", "{\"a\":\"\xFF"}) {
    Catalogue::Texts texts;
    std::string error;
    EXPECT_FALSE(Catalogue::Read(json, texts, error)) << json;
    EXPECT_NE("", error) << json;
    EXPECT_EQ(std::string::npos, error.find('\n')) << json;
  }
}

TEST(Catalogue, SurvivesDeepNesting) {
  Catalogue::Texts texts;
  std::string error;
  EXPECT_FALSE(Catalogue::Read(std::string(100000, '['), texts, error));
  EXPECT_NE("", error);
}

TEST(Catalogue, FillsPlacesAndLeavesOthers) {
  const Catalogue texts(Catalogue::Texts{{"a", "{name} and {name}, {other} {"}});
  EXPECT_EQ("{x} and {x}, {other} {", texts.Text("a", {{"name", "{x}"}}));
}

TEST(Catalogue, ShowsAKeyThatHasNoText) {
  EXPECT_EQ("«nothing»", Catalogue(Catalogue::Texts()).Text("nothing"));
}

TEST(Catalogue, WritesSizesInTheLanguage) {
  const Catalogue english(TextsOf("en"));
  const Catalogue german(TextsOf("de"));
  const std::vector<std::tuple<uint64_t, std::string, std::string>> table = {
      {0, "0 bytes", "0 Byte"},
      {1, "1 byte", "1 Byte"},
      {999, "999 bytes", "999 Byte"},
      {1000, "1.0\u00A0kB", "1,0\u00A0kB"},
      {1049, "1.0\u00A0kB", "1,0\u00A0kB"},
      {1050, "1.1\u00A0kB", "1,1\u00A0kB"},
      {9949, "9.9\u00A0kB", "9,9\u00A0kB"},
      {9950, "10\u00A0kB", "10\u00A0kB"},
      {999499, "999\u00A0kB", "999\u00A0kB"},
      {999500, "1.0\u00A0MB", "1,0\u00A0MB"},
      {5000000000, "5.0\u00A0GB", "5,0\u00A0GB"},
      {999500000000000, "1.0\u00A0PB", "1,0\u00A0PB"},
      {UINT64_MAX, "18\u00A0EB", "18\u00A0EB"},
  };
  for (const auto &[bytes, in_english, in_german] : table) {
    EXPECT_EQ(in_english, english.Size(bytes)) << bytes;
    EXPECT_EQ(in_german, german.Size(bytes)) << bytes;
  }
}

TEST(Catalogue, GroupsDigits) {
  const Catalogue english(TextsOf("en"));
  EXPECT_EQ("0", english.Number(0));
  EXPECT_EQ("999", english.Number(999));
  EXPECT_EQ("1,000", english.Number(1000));
  EXPECT_EQ("18,446,744,073,709,551,615", english.Number(UINT64_MAX));
  EXPECT_EQ("1.234.567", Catalogue(TextsOf("de")).Number(1234567));
}

TEST(Catalogue, CountsInSingularAndPlural) {
  const Catalogue english(TextsOf("en"));
  EXPECT_EQ("0 items", english.Count("items", 0));
  EXPECT_EQ("1 item", english.Count("items", 1));
  EXPECT_EQ("1,200 items", english.Count("items", 1200));
}

/// Runs in a process of its own, as every test does here; the zone is put back all the same.
class CatalogueTime : public ::testing::Test {
 protected:
  void SetUp() override { UseZone("UTC0"); }
  void TearDown() override {
    unsetenv("TZ");
    tzset();
  }
  static void UseZone(const char *zone) {
    setenv("TZ", zone, 1);
    tzset();
  }
};

TEST_F(CatalogueTime, IsWrittenInTheLanguage) {
  constexpr time_t kTime = 1772613299;  // 4 March 2026, 08:34:59
  EXPECT_EQ("4 Mar 2026, 08:34", Catalogue(TextsOf("en")).Time(kTime));
  EXPECT_EQ("04.03.2026, 08:34", Catalogue(TextsOf("de")).Time(kTime));
}

TEST_F(CatalogueTime, IsThatOfTheProcess) {
  UseZone("XXX-2");
  EXPECT_EQ("1 Jan 1970, 02:00", Catalogue(TextsOf("en")).Time(0));
}

TEST_F(CatalogueTime, MayLieBeforeTheEpoch) {
  EXPECT_EQ("31 Dec 1969, 23:59", Catalogue(TextsOf("en")).Time(-1));
}

TEST_F(CatalogueTime, IsEmptyWhenNoCalendarHasIt) {
  EXPECT_EQ("", Catalogue(TextsOf("en")).Time(INT64_MAX));
  EXPECT_EQ("", Catalogue(TextsOf("en")).Time(INT64_MIN));
}

}  // namespace
}  // namespace web
