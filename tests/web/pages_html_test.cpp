// The pages as they leave the program: nothing hostile gets out of its place, and each view shows
// what it should.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <regex>
#include <string>
#include <vector>

#include "pages/pages.h"

namespace web {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

const Reader kEnglish{"en", "token-1"};

LinkView Link(const std::string &title = "Holiday") {
  return {.hash = "aB3xK9pQ2", .title = title, .can_log_out = true};
}

FolderEntry Named(const std::string &name, FileKind kind = FileKind::kOther) {
  return {.name = name, .kind = kind, .size = 1234, .modified = 1795426496};
}

FolderView Folder(std::vector<FolderEntry> entries) {
  return {.link = Link(), .path = {"sub folder"}, .entries = std::move(entries)};
}

FileView File(FileKind kind) {
  return {.link = Link(),
          .path = {"sub folder", "a file"},
          .name = "a file",
          .kind = kind,
          .media_type = "text/x",
          .size = 1234,
          .modified = 1795426496,
          .can_view = true};
}

/// Every page, with one text in each place that a stranger may fill.
std::vector<std::string> PagesWith(const Pages &pages, const std::string &text,
                                   const std::string &language) {
  const Reader reader{language, "token-1"};
  LinkView link = Link(text);
  link.continue_to = "https://example.org/";
  FolderEntry image = Named(text, FileKind::kImage);
  image.has_thumbnail = true;
  FolderView folder = Folder({Named(text), Named(text, FileKind::kFolder), image});
  folder.link = link;
  folder.path = {text, text};
  folder.is_incomplete = true;
  FolderView empty = folder;
  empty.entries.clear();

  std::vector<std::string> written = {pages.Password(reader, {link, LoginProblem::kRefused, text}),
                                      pages.Account(reader, {link, LoginProblem::kRefused, text}),
                                      pages.Open(reader, {link, LoginProblem::kFormExpired, text}),
                                      pages.Continue(reader, link, link.continue_to),
                                      pages.Continue(reader, link, "https://example.org/"),
                                      pages.Folder(reader, folder),
                                      pages.Folder(reader, empty),
                                      pages.Leave(reader, link),
                                      pages.LoggedOut(reader, link)};
  for (const int status : {400, 403, 404, 405, 408, 413, 414, 418, 429, 431, 500, 503, 507}) {
    for (const long seconds : {0L, 30L, 60L, 20000L, 500000L}) {
      written.push_back(pages.Message(reader, status, seconds));
    }
  }
  for (const FileKind kind : {FileKind::kImage, FileKind::kText, FileKind::kAudio, FileKind::kVideo,
                              FileKind::kPdf, FileKind::kArchive, FileKind::kOther}) {
    FileView file = File(kind);
    file.link = link;
    file.path = {text, text};
    file.name = file.media_type = file.previous = file.next = text;
    if (kind == FileKind::kText) file.text = text;
    file.text_is_cut = true;
    written.push_back(pages.File(reader, file));
    file.can_download = false;
    written.push_back(pages.File(reader, file));
  }
  return written;
}

/// The page's elements, without their attributes' values and without text.
std::string Skeleton(const std::string &page) {
  static const std::regex value("\"[^\"]*\"");
  static const std::regex between(">[^<]*<");
  return std::regex_replace(std::regex_replace(page, value, "\"\""), between, "><");
}

size_t CountOf(const std::string &page, const std::string &what) {
  size_t count = 0;
  for (size_t at = page.find(what); at != std::string::npos; at = page.find(what, at + 1)) ++count;
  return count;
}

TEST(Pages, GiveHostileTextNoElementAndNoAttribute) {
  const Pages pages({});
  const std::vector<std::string> hostile = {
      "<script>alert(1)</script>",
      "</title></pre></textarea><script>alert(1)</script>",
      "\"><img src=x onerror=alert(1)>",
      "' onmouseover='alert(1)",
      "\" autofocus onfocus=\"alert(1)",
      "--><!--",
      "]]><svg onload=alert(1)>",
      "&lt;b&gt; &#34; &quot;",
      "{{#links}}{{{csrf}}}{{/links}}{{> layout}}{{=<% %>=}}",
      "javascript:alert(1)",
      "../../etc/passwd?\"#'",
      "\u202E\u2028\"",
      "a\xFF\" x=\"\xC0",
      std::string("a\0\"b", 4),
      "a\r\n\"b",
  };
  const std::vector<std::string> plain = PagesWith(pages, "plain", "en");
  const std::vector<std::string> broken = PagesWith(pages, "broken\n", "en");
  for (const std::string &text : hostile) {
    const bool has_checkbox = text.find_first_of(std::string("\xFF\r\0", 3)) == std::string::npos;
    const std::vector<std::string> &expected = has_checkbox ? plain : broken;
    const std::vector<std::string> written = PagesWith(pages, text, "en");
    ASSERT_EQ(expected.size(), written.size());
    for (size_t i = 0; i < written.size(); ++i) {
      EXPECT_EQ(Skeleton(expected[i]), Skeleton(written[i])) << text;
      EXPECT_THAT(written[i], Not(HasSubstr("href=\"javascript:"))) << text;
      EXPECT_THAT(written[i], Not(HasSubstr("\xFF"))) << text;
      EXPECT_THAT(written[i], Not(HasSubstr(std::string(1, '\0')))) << text;
    }
  }
}

TEST(Pages, DoNotTakeTextsForTemplates) {
  const std::string page = Pages({}).Password(kEnglish, {.link = Link("{{csrf}}{{{csrf}}}")});
  EXPECT_THAT(page, HasSubstr("{{csrf}}{{{csrf}}}"));
}

TEST(Pages, HaveATextForEverythingInEachLanguage) {
  const Pages pages({});
  for (const char *language : {"en", "de"}) {
    for (const std::string &page : PagesWith(pages, "x", language)) {
      EXPECT_THAT(page, Not(HasSubstr("\u00AB"))) << page;
      EXPECT_THAT(page, HasSubstr(std::string("<html lang=\"") + language + "\">"));
    }
  }
}

TEST(Pages, LeaveNoPlaceInATextEmpty) {
  static const std::regex place("\\{[a-z]+\\}");
  for (const std::string &page : PagesWith(Pages({}), "x", "de")) {
    EXPECT_FALSE(std::regex_search(page, place)) << page;
  }
}

TEST(Pages, HaveNoScriptAndNoStyleOfTheirOwn) {
  for (const std::string &page : PagesWith(Pages({}), "x", "en")) {
    EXPECT_THAT(page, Not(HasSubstr("<script")));
    EXPECT_THAT(page, Not(HasSubstr("<style")));
    EXPECT_THAT(page, Not(HasSubstr("style=")));
  }
}

TEST(Pages, SpeakEnglishWhenTheLanguageIsNotKnown) {
  EXPECT_THAT(Pages({}).Message({"tlh", ""}, 404), HasSubstr("<html lang=\"en\">"));
}

TEST(Pages, AreTheSameForTheSameArguments) {
  EXPECT_EQ(Pages({}).Message({"de", ""}, 404), Pages({}).Message({"de", ""}, 404));
}

TEST(PasswordPage, AsksForOnePasswordOnly) {
  const std::string page =
      Pages({.password_field = "word"}).Password(kEnglish, {.link = Link("Summer & sun")});
  EXPECT_THAT(page, HasSubstr("<bdi>Summer &amp; sun</bdi>"));
  EXPECT_THAT(page,
              HasSubstr("<form class=\"stack\" method=\"post\" action=\"/sharing/aB3xK9pQ2\">"));
  EXPECT_THAT(page, HasSubstr("name=\"csrf\" value=\"token-1\""));
  EXPECT_THAT(page, HasSubstr("name=\"word\" type=\"password\" autocomplete=\"current-password\""));
  EXPECT_EQ(1u, CountOf(page, "type=\"password\""));
  EXPECT_EQ(0u, CountOf(page, "type=\"text\""));
  EXPECT_THAT(page, Not(HasSubstr("role=\"alert\"")));
}

TEST(PasswordPage, TellsARefusalWhereAScreenReaderHearsIt) {
  const std::string page =
      Pages({}).Password(kEnglish, {.link = Link(), .problem = LoginProblem::kRefused});
  EXPECT_THAT(page,
              HasSubstr("<p class=\"alert\" role=\"alert\" id=\"problem\">That did not work."));
  EXPECT_THAT(page, HasSubstr("aria-invalid=\"true\" aria-describedby=\"problem\""));
}

TEST(PasswordPage, CallsALinkWithoutTitleSharedFiles) {
  EXPECT_THAT(Pages({}).Password(kEnglish, {.link = Link("")}), HasSubstr("Shared files"));
}

TEST(LoginPages, OfferNothingToLeave) {
  const Pages pages({});
  const LoginView view{.link = Link()};
  for (const std::string &page : {pages.Password(kEnglish, view), pages.Account(kEnglish, view),
                                  pages.Open(kEnglish, view)}) {
    EXPECT_THAT(page, Not(HasSubstr("logout")));
  }
}

TEST(AccountPage, KeepsTheNameAndAsksForThePassword) {
  const Pages pages({.account_field = "who", .account_password_field = "word"});
  const std::string page = pages.Account(
      kEnglish, {.link = Link(), .problem = LoginProblem::kRefused, .account = "b\"ob"});
  EXPECT_THAT(page, HasSubstr("name=\"who\" type=\"text\" value=\"b&quot;ob\""));
  EXPECT_THAT(page, HasSubstr("name=\"word\" type=\"password\""));
  EXPECT_EQ(1u, CountOf(page, " autofocus"));
  EXPECT_GT(page.find(" autofocus"), page.find("id=\"password\""));
}

TEST(OpenPage, HasOneButton) {
  const std::string page = Pages({}).Open(kEnglish, {.link = {.hash = "aB3xK9pQ2"}});
  EXPECT_EQ(1u, CountOf(page, "<button"));
  EXPECT_THAT(page, HasSubstr("method=\"post\" action=\"/sharing/aB3xK9pQ2\""));
}

TEST(ContinuePage, GoesOnByItself) {
  const std::string page = Pages({}).Continue(kEnglish, Link(), "https://example.org/a?b=1&c=2");
  EXPECT_THAT(page, HasSubstr("content=\"0; url=https://example.org/a?b=1&amp;c=2\""));
  EXPECT_THAT(page, HasSubstr("href=\"https://example.org/a?b=1&amp;c=2\""));
  EXPECT_THAT(page, HasSubstr("Going on to example.org"));
}

TEST(ContinuePage, StaysWithTheLinkWhenTheTargetIsNone) {
  const std::string page = Pages({}).Continue(kEnglish, Link(), "javascript:alert(1)");
  EXPECT_THAT(page, Not(HasSubstr("http-equiv")));
  EXPECT_THAT(page, Not(HasSubstr("javascript")));
  EXPECT_THAT(page, HasSubstr("class=\"button main\" href=\"/sharing/aB3xK9pQ2\""));
}

TEST(FolderPage, LinksTheExactBytesOfAName) {
  const std::string page = Pages({}).Folder(kEnglish, Folder({Named("a \xFF?.txt")}));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/a%20%FF%3F.txt\""));
  EXPECT_THAT(page, HasSubstr("<bdi>a \uFFFD?.txt</bdi>"));
}

TEST(FolderPage, OffersNoSelectionOfANameThatAFormWouldChange) {
  EXPECT_EQ(0u, CountOf(Pages({}).Folder(kEnglish, Folder({Named("\xFF")})), "type=\"checkbox\""));
  EXPECT_EQ(1u, CountOf(Pages({}).Folder(kEnglish, Folder({Named("a")})), "type=\"checkbox\""));
}

TEST(FolderPage, SendsASelectionAsNames) {
  const std::string page = Pages({}).Folder(kEnglish, Folder({Named("a&b")}));
  EXPECT_THAT(page, HasSubstr("<form method=\"get\" action=\"/sharing/aB3xK9pQ2/sub%20folder/\">"));
  EXPECT_THAT(page, HasSubstr("<input type=\"hidden\" name=\"zip\" value=\"\">"));
  EXPECT_THAT(page, HasSubstr("<input type=\"checkbox\" name=\"name\" value=\"a&amp;b\">"));
}

TEST(FolderPage, PutsASlashBehindFoldersAlone) {
  const std::string page =
      Pages({}).Folder(kEnglish, Folder({Named("in", FileKind::kFolder), Named("out")}));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/in/\""));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/in/?zip\""));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/out\""));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/out?download\""));
}

TEST(FolderPage, LinksEachColumnToItsOrder) {
  FolderView view = Folder({Named("a")});
  view.path.clear();
  view.sort = SortBy::kSize;
  view.is_descending = true;
  const std::string page = Pages({}).Folder(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2?sort=name&amp;order=asc\""));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2?sort=size&amp;order=asc\""));
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2?sort=date&amp;order=desc\""));
  EXPECT_EQ(1u, CountOf(page, "aria-sort=\"descending\""));
  EXPECT_EQ(1u, CountOf(page, "aria-sort="));
}

TEST(FolderPage, ShowsItsImagesInAGallery) {
  FolderEntry image = Named("sea.jpg", FileKind::kImage);
  image.has_thumbnail = true;
  const std::string page = Pages({}).Folder(kEnglish, Folder({Named("a"), image}));
  EXPECT_THAT(page, HasSubstr("src=\"/sharing/aB3xK9pQ2/sub%20folder/sea.jpg?thumbnail\""));
  EXPECT_EQ(1u, CountOf(page, "<img"));
  EXPECT_THAT(page, HasSubstr("1 image"));
  EXPECT_THAT(Pages({}).Folder(kEnglish, Folder({Named("a")})), Not(HasSubstr("gallery")));
}

TEST(FolderPage, OffersNothingToTakeAwayWhereDownloadsAreHidden) {
  FolderView view = Folder({Named("a"), Named("in", FileKind::kFolder)});
  view.can_download = false;
  const std::string page = Pages({}).Folder(kEnglish, view);
  for (const char *way :
       {"zip", "?download", "checkbox", "Download", "type=\"submit\" class=\"main"}) {
    EXPECT_THAT(page, Not(HasSubstr(way)));
  }
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2/sub%20folder/a\""));
}

TEST(FolderPage, LeadsBackUpTheWay) {
  FolderView view = Folder({});
  view.path = {"a", "b", "c"};
  const std::string page = Pages({}).Folder(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("<a href=\"/sharing/aB3xK9pQ2\"><bdi>Holiday</bdi></a>"));
  EXPECT_THAT(page, HasSubstr("<a href=\"/sharing/aB3xK9pQ2/a/\"><bdi>a</bdi></a>"));
  EXPECT_THAT(page, HasSubstr("<a href=\"/sharing/aB3xK9pQ2/a/b/\"><bdi>b</bdi></a>"));
  EXPECT_THAT(page, HasSubstr("<span aria-current=\"page\"><bdi>c</bdi></span>"));
}

TEST(FolderPage, IsDividedWhenThereIsMuchToShow) {
  FolderView view = Folder({});
  for (size_t i = 0; i < Pages::kEntriesPerPage * 2 + 1; ++i) {
    view.entries.push_back(Named("file" + std::to_string(i) + "."));
  }
  view.sort = SortBy::kDate;
  view.page = 2;
  const std::string middle = Pages({}).Folder(kEnglish, view);
  EXPECT_EQ(Pages::kEntriesPerPage, CountOf(middle, "<td class=\"name\""));
  EXPECT_THAT(middle, Not(HasSubstr("file499.")));
  EXPECT_THAT(middle, HasSubstr("file500."));
  EXPECT_THAT(middle, HasSubstr("Page 2 of 3"));
  EXPECT_THAT(middle, HasSubstr("1,001 items"));
  const std::string folder = "href=\"/sharing/aB3xK9pQ2/sub%20folder/?sort=date&amp;order=asc&amp;";
  EXPECT_THAT(middle, HasSubstr(folder + "page=1\""));
  EXPECT_THAT(middle, HasSubstr(folder + "page=3\""));
  view.page = 1;
  EXPECT_EQ(1u, CountOf(Pages({}).Folder(kEnglish, view), "&amp;page="));
  view.page = SIZE_MAX;
  const std::string last = Pages({}).Folder(kEnglish, view);
  EXPECT_EQ(1u, CountOf(last, "<td class=\"name\""));
  EXPECT_THAT(last, HasSubstr("Page 3 of 3"));
  view.page = 0;
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), HasSubstr("Page 1 of 3"));
}

TEST(FolderPage, IsNotDividedWhenItFitsOnOnePage) {
  FolderView view = Folder({});
  view.entries.assign(Pages::kEntriesPerPage, Named("a"));
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), Not(HasSubstr("page=")));
}

TEST(FolderPage, SaysThatItIsEmpty) {
  const std::string page = Pages({}).Folder(kEnglish, Folder({}));
  EXPECT_THAT(page, HasSubstr("There is nothing in this folder."));
  EXPECT_THAT(page, Not(HasSubstr("<table")));
  EXPECT_THAT(page, Not(HasSubstr("?zip")));
}

TEST(FolderPage, OffersToLogOutOnlyWhereThereIsASession) {
  FolderView view = Folder({});
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), HasSubstr("action=\"/sharing/aB3xK9pQ2/logout\""));
  view.link.can_log_out = false;
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), Not(HasSubstr("logout")));
}

TEST(FolderPage, OffersToGoOnToWebAddressesAlone) {
  FolderView view = Folder({});
  view.link.continue_to = "https://user@example.org/album";
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), HasSubstr("Go on to example.org"));
  view.link.continue_to = "javascript:alert(1)";
  EXPECT_THAT(Pages({}).Folder(kEnglish, view), Not(HasSubstr("Go on to")));
}

TEST(FilePage, ShowsEachKindInItsElement) {
  const std::string view = "src=\"/sharing/aB3xK9pQ2/sub%20folder/a%20file?view";
  const std::vector<std::pair<FileKind, std::string>> table = {{FileKind::kImage, "<img "},
                                                               {FileKind::kAudio, "<audio "},
                                                               {FileKind::kVideo, "<video "},
                                                               {FileKind::kPdf, "<iframe "}};
  for (const auto &[kind, element] : table) {
    const std::string page = Pages({}).File(kEnglish, File(kind));
    EXPECT_THAT(page, HasSubstr(element));
    EXPECT_EQ(1u, CountOf(page, view)) << element;
  }
}

TEST(FilePage, SaysThatThereIsNoPreview) {
  FileView view = File(FileKind::kImage);
  view.can_view = false;
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("There is no preview of this file."));
  EXPECT_THAT(page, Not(HasSubstr("?view")));
}

TEST(FilePage, ShowsTextAsItStands) {
  FileView view = File(FileKind::kText);
  view.text = "\n<b>\tone</b>\n";
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, HasSubstr(">\n\n&lt;b&gt;\tone&lt;/b&gt;\n</pre>"));
  EXPECT_THAT(page, Not(HasSubstr("Only the beginning")));
}

TEST(FilePage, CutsLongTextBetweenCharacters) {
  FileView view = File(FileKind::kText);
  view.text = "a";
  while (view.text->size() <= Pages::kTextPreviewBytes) *view.text += "\u20AC";
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("Only the beginning is shown."));
  EXPECT_THAT(page, Not(HasSubstr("\uFFFD")));
  EXPECT_LT(page.size(), Pages::kTextPreviewBytes + 8192);
}

TEST(FilePage, HasNoWayToSaveWhereDownloadsAreHidden) {
  FileView view = File(FileKind::kPdf);
  view.can_download = false;
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, Not(HasSubstr("?download")));
  EXPECT_THAT(page, HasSubstr("?view#toolbar=0\""));
}

TEST(FilePage, LeadsToItsNeighbours) {
  FileView view = File(FileKind::kImage);
  view.previous = "b/..";
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("rel=\"prev\" href=\"/sharing/aB3xK9pQ2/sub%20folder/b%2F..\""));
  EXPECT_THAT(page, Not(HasSubstr("rel=\"next\"")));
}

TEST(FilePage, OfASharedFileHasTheAddressOfTheLink) {
  FileView view = File(FileKind::kImage);
  view.path.clear();
  const std::string page = Pages({}).File(kEnglish, view);
  EXPECT_THAT(page, HasSubstr("href=\"/sharing/aB3xK9pQ2?download\""));
  EXPECT_THAT(page, Not(HasSubstr("class=\"crumbs\"")));
}

TEST(MessagePage, HasTheWordsOfItsStatus) {
  const std::vector<std::pair<int, std::string>> table = {
      {404, "There is nothing here"},   {429, "Too many attempts"},
      {503, "Not available right now"}, {405, "This cannot be done here"},
      {418, "This did not work"},       {507, "Something went wrong"}};
  for (const auto &[status, title] : table) {
    EXPECT_THAT(Pages({}).Message(kEnglish, status), HasSubstr("<h1>" + title + "</h1>"));
  }
}

TEST(MessagePage, SaysWhenAnotherTryMakesSense) {
  const std::vector<std::pair<long, std::string>> table = {
      {1, "in a moment"},       {59, "in a moment"},       {60, "in 1 minute."},
      {61, "in 2 minutes."},    {7200, "in 120 minutes."}, {7201, "in 3 hours."},
      {172800, "in 48 hours."}, {172801, "in 3 days."}};
  for (const auto &[seconds, text] : table) {
    EXPECT_THAT(Pages({}).Message(kEnglish, 429, seconds), HasSubstr(text)) << seconds;
  }
  EXPECT_THAT(Pages({}).Message(kEnglish, 429), Not(HasSubstr("try again in")));
}

TEST(MessagePage, KnowsNothingOfTheVisitor) {
  EXPECT_EQ(Pages({}).Message({"en", "one"}, 404), Pages({}).Message({"en", "two"}, 404));
}

TEST(LeavePage, HasOneButtonToLogOutAndAWayBack) {
  const std::string page = Pages({}).Leave(kEnglish, Link());
  const std::string form =
      "<form class=\"stack\" method=\"post\" action=\"/sharing/aB3xK9pQ2/logout\">";
  EXPECT_THAT(page, HasSubstr(form));
  EXPECT_EQ(page.find("/logout\""), page.rfind("/logout\""));
  EXPECT_THAT(page, HasSubstr("<a href=\"/sharing/aB3xK9pQ2\">Back</a>"));
}

TEST(LoggedOutPage, LeadsBackAndOffersNoLogout) {
  const std::string page = Pages({}).LoggedOut(kEnglish, Link());
  EXPECT_THAT(page, HasSubstr("class=\"button\" href=\"/sharing/aB3xK9pQ2\""));
  EXPECT_THAT(page, Not(HasSubstr("/logout")));
}

}  // namespace
}  // namespace web
