#ifndef VELKSHARING_WEB_PAGES_VIEWS_H
#define VELKSHARING_WEB_PAGES_VIEWS_H

#include <cstddef>
#include <cstdint>
#include <ctime>
#include <optional>
#include <string>
#include <vector>

/// What the pages show, as plain values.
///
/// Every text here is plain: names are the bytes that the file system has, titles are what the
/// owner wrote. Nothing is escaped, percent-encoded, translated or cleaned before; the pages do
/// that, for broken UTF-8, too.

namespace web {

/// Who reads a page.
struct Reader {
  std::string language{};  ///< What Pages::ChooseLanguage() gave.
  /// The token of every form that is posted, as hidden field `csrf`; letters, digits and `-_`.
  std::string csrf{};
};

/// The link that a page belongs to.
struct LinkView {
  std::string hash{};
  std::string title{};  ///< "" for none: the page then speaks of "shared files".
  /// Whether there is something to leave: shows the button that posts to base/HASH/logout. Never
  /// shown on the pages in front of a link.
  bool can_log_out = false;
  /// Where the link's owner wants visitors to go on; "" for none. An http(s) address, checked by
  /// the caller; anything else is left out.
  std::string continue_to{};
};

/// Why a visitor is asked again.
enum class LoginProblem {
  kNone,        ///< First time.
  kRefused,     ///< The credentials do not open the link, whatever the reason.
  kFormExpired  ///< The form's token was missing or too old; nothing was tried.
};

/// The page that a link's protection needs. Its form posts to base/HASH.
struct LoginView {
  LinkView link{};
  LoginProblem problem = LoginProblem::kNone;
  std::string account{};  ///< Account page only: the name that was typed, shown again.
  /// Path and query that the visitor came for; the form's address takes it along. "" for none.
  std::string return_to{};
};

/// What a file is, as far as icon and preview are concerned.
enum class FileKind { kFolder, kImage, kText, kAudio, kVideo, kPdf, kArchive, kOther };

/// One line of a folder.
struct FolderEntry {
  std::string name{};  ///< One component, not "" "." "..".
  FileKind kind = FileKind::kOther;
  uint64_t size = 0;  ///< In bytes; not shown for folders.
  time_t modified = 0;
  bool has_thumbnail = false;  ///< Whether `?thumbnail` gives a small image.
};

enum class SortBy { kName, kSize, kDate };

/// A folder, all of it. Its own address ends with a slash, but for the shared folder itself.
struct FolderView {
  LinkView link{};
  std::vector<std::string> path{};     ///< Components below the shared folder; empty for itself.
  std::vector<FolderEntry> entries{};  ///< In the order to be shown: sorted by the caller.
  SortBy sort = SortBy::kName;         ///< The order that they have, for the column heads.
  bool is_descending = false;
  size_t page = 1;             ///< Which Pages::kEntriesPerPage of them to show; beyond: the last.
  bool is_incomplete = false;  ///< Whether there were too many to show them all.
  bool can_download = true;    ///< false: no downloads, no selection, no ZIP.
};

/// One file and, where a browser can show it, its content.
struct FileView {
  LinkView link{};
  /// Components below the shared folder, the file's name last; empty when the link shares this
  /// very file.
  std::vector<std::string> path{};
  std::string name{};
  FileKind kind = FileKind::kOther;
  std::string media_type{};  ///< "image/png"; for the site's own templates.
  uint64_t size = 0;         ///< In bytes.
  time_t modified = 0;
  /// Whether `?view` gives the content inline. Without it only `text` is previewed.
  bool can_view = false;
  /// The beginning of a text file in UTF-8; more than Pages::kTextPreviewBytes is cut off. Shown
  /// in the place of any other preview.
  std::optional<std::string> text{};
  bool text_is_cut = false;  ///< Whether the file goes on behind `text`.
  bool can_download = true;
  /// Names of the files before and behind this one in the folder; "" for none.
  std::string previous{};
  std::string next{};
};

}  // namespace web

#endif
