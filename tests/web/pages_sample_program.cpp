// Writes one of each page into a folder, as sample-NAME.html, and the files they refer to into the
// folder "-" below it; the file "policy" has their Content-Security-Policy. For the browser tests,
// which look at pages, too, that a server shows only when something is wrong.

#include <filesystem>
#include <iostream>
#include <string>

#include "pages/pages.h"
#include "support/temp_dir.h"

namespace {

constexpr time_t kMonday = 1795426496;  // 23 November 2026

web::LinkView HolidayLink() {
  return {.hash = "aB3xK9pQ2", .title = "Holiday on the coast", .can_log_out = true};
}

web::FolderEntry Entry(const std::string &name, web::FileKind kind, uint64_t size, int hours) {
  return {.name = name, .kind = kind, .size = size, .modified = kMonday - hours * 3600L};
}

web::FolderView Documents() {
  using web::FileKind;
  return {.link = HolidayLink(),
          .path = {"Documents", "2026"},
          .entries = {Entry("Letters", FileKind::kFolder, 0, 5),
                      Entry("A very long name of a file that somebody did not want to shorten, "
                            "although_it_has_words_without_any_blank_in_them_at_all.txt",
                            FileKind::kText, 1834, 40),
                      Entry("Accounts.pdf", FileKind::kPdf, 2834411, 500),
                      Entry("Backup.tar.gz", FileKind::kArchive, 7344119834, 2),
                      Entry("Interview.ogg", FileKind::kAudio, 48111034, 90),
                      Entry("Trailer.webm", FileKind::kVideo, 188111034, 91),
                      Entry("broken \xFF name", FileKind::kOther, 12, 4000)}};
}

web::FolderView Without(web::FolderView view, bool entries) {
  if (!entries) view.entries.clear();
  view.can_download = entries && view.can_download;
  return view;
}

web::FileView TextFile() {
  return {.link = HolidayLink(),
          .path = {"Documents", "Packing list.txt"},
          .name = "Packing list.txt",
          .kind = web::FileKind::kText,
          .media_type = "text/plain",
          .size = 900000,
          .modified = kMonday,
          .can_view = true,
          .text = "Tent\nTowels & <soap>\n\tToothbrush\n",
          .text_is_cut = true,
          .can_download = true,
          .previous = "Map.png",
          .next = "Route.gpx"};
}

web::FileView BinaryFile() {
  web::FileView view = TextFile();
  view.name = view.path.back() = "Backup.tar.gz";
  view.kind = web::FileKind::kArchive;
  view.can_view = view.text_is_cut = false;
  view.text.reset();
  return view;
}

class Writer {
 public:
  Writer(const std::string &folder, const std::string &language)
      : folder_(folder), reader_{language, "sampletoken"} {}

  void WriteAll() {
    const web::LinkView link = {.hash = "aB3xK9pQ2", .title = "Holiday on the coast"};
    using web::LoginProblem;
    Write("password", pages_.Password(reader_, {link}));
    Write("password-wrong", pages_.Password(reader_, {link, LoginProblem::kRefused}));
    Write("account", pages_.Account(reader_, {link}));
    Write("account-wrong", pages_.Account(reader_, {link, LoginProblem::kRefused, "bob"}));
    Write("open", pages_.Open(reader_, {link, LoginProblem::kFormExpired}));
    Write("continue", pages_.Continue(reader_, link, "javascript:0"));
    Write("folder", pages_.Folder(reader_, Documents()));
    Write("folder-empty", pages_.Folder(reader_, Without(Documents(), false)));
    web::FolderView looking = Documents();
    looking.can_download = false;
    looking.is_incomplete = true;
    looking.link.continue_to = "https://www.example.org/albums";
    Write("folder-looking", pages_.Folder(reader_, looking));
    web::FolderView last = Documents();
    last.entries.resize(web::Pages::kEntriesPerPage + 3, last.entries.back());
    last.page = 2;
    Write("folder-second-page", pages_.Folder(reader_, last));
    Write("file-text", pages_.File(reader_, TextFile()));
    Write("file-binary", pages_.File(reader_, BinaryFile()));
    Write("leave", pages_.Leave(reader_, link));
    Write("logged-out", pages_.LoggedOut(reader_, link));
    Write("message-404", pages_.Message(reader_, 404));
    Write("message-429", pages_.Message(reader_, 429, 1200));
    Write("message-503", pages_.Message(reader_, 503, 30));
    velk_test::WriteFile(folder_ + "/policy", std::string(web::Pages::kContentSecurityPolicy));
  }

 private:
  void Write(const std::string &name, const std::string &page) {
    velk_test::WriteFile(folder_ + "/sample-" + name + ".html", page);
    WriteAssets(page);
  }

  void WriteAssets(const std::string &page) {
    const std::string start = "/sharing/-/";
    for (size_t at = page.find(start); at != std::string::npos; at = page.find(start, at)) {
      at += start.size();
      const std::string name = page.substr(at, page.find_first_of("\"#", at) - at);
      velk_test::WriteFile(folder_ + "/-/" + name, pages_.FindAsset(name)->bytes);
    }
  }

  const std::string folder_;
  const web::Reader reader_;
  const web::Pages pages_{{}};
};

}  // namespace

int main(int count, char **arguments) {
  if (count != 3) {
    std::cerr << "usage: pages_sample_program FOLDER LANGUAGE\n";
    return 2;
  }
  std::filesystem::create_directories(std::string(arguments[1]) + "/-");
  Writer(arguments[1], arguments[2]).WriteAll();
  return 0;
}
