#include "site/shared_answers.h"

#include <velksharing/access.h>

#include <charconv>
#include <optional>
#include <utility>

#include "http/path.h"
#include "share/download.h"
#include "share/media_type.h"
#include "share/preview.h"
#include "share/thumbnail.h"
#include "share/zip.h"
#include "site/result_names.h"

namespace web {
namespace {

share::Order OrderOf(const Form &query) {
  share::Order order;
  const std::string *by = query.Find("sort");
  if (by != nullptr && *by == "size") order.by = share::SortBy::SIZE;
  if (by != nullptr && *by == "date") order.by = share::SortBy::DATE;
  const std::string *direction = query.Find("order");
  order.is_descending = direction != nullptr && *direction == "desc";
  return order;
}

/// 1 for what is no number.
size_t PageOf(const Form &query) {
  const std::string *number = query.Find("page");
  size_t page = 1;
  if (number != nullptr) std::from_chars(number->data(), number->data() + number->size(), page);
  return page;
}

SortBy ShownOrder(share::SortBy by) {
  switch (by) {
    case share::SortBy::SIZE:
      return SortBy::kSize;
    case share::SortBy::DATE:
      return SortBy::kDate;
    case share::SortBy::NAME:
      break;
  }
  return SortBy::kName;
}

bool IsArchive(const std::string &name) {
  const std::string &type = share::MediaTypeByName(name);
  return type.starts_with("application/") && share::IsCompressed(type);
}

FileKind KindOf(const std::string &name, share::PreviewKind preview) {
  switch (preview) {
    case share::PreviewKind::TEXT:
      return FileKind::kText;
    case share::PreviewKind::IMAGE:
      return FileKind::kImage;
    case share::PreviewKind::AUDIO:
      return FileKind::kAudio;
    case share::PreviewKind::VIDEO:
      return FileKind::kVideo;
    case share::PreviewKind::PDF:
      return FileKind::kPdf;
    case share::PreviewKind::OTHER:
      break;
  }
  return IsArchive(name) ? FileKind::kArchive : FileKind::kOther;
}

/// Whether a browser shows the file itself, and not a page that quotes it.
bool IsShownByBrowser(share::PreviewKind preview) {
  return preview != share::PreviewKind::TEXT && preview != share::PreviewKind::OTHER;
}

FolderEntry LineOf(const share::Entry &entry) {
  FolderEntry line;
  line.name = entry.name;
  line.kind = entry.is_folder ? FileKind::kFolder : KindOf(entry.name, entry.preview);
  line.size = static_cast<uint64_t>(entry.size);
  line.modified = entry.changed;
  line.has_thumbnail = entry.has_thumbnail;
  return line;
}

bool IsAttachment(const Response &response) {
  return response.headers.Get("Content-Disposition").starts_with("attachment");
}

}  // namespace

bool SharedRequest::AsksForBytes() const {
  return query.Has("download") || query.Has("view") || query.Has("thumbnail") || query.Has("zip");
}

SharedAnswers::SharedAnswers(const Answers &answers, const Pages &pages, const SharedView &view,
                             const share::SharedTree &tree)
    : answers_(answers), pages_(pages), view_(view), tree_(tree) {}

Response SharedAnswers::Answer(const SharedRequest &wanted, std::optional<share::Item> item,
                               AccessNote &note) const {
  if (!item || (!item->is_folder && !wanted.parts.empty() && wanted.ends_with_slash))
    return answers_.Error(404);
  if (item->is_folder) return Folder(wanted, *item, note);
  return File(wanted, std::move(*item), note);
}

Response SharedAnswers::Folder(const SharedRequest &wanted, const share::Item &folder,
                               AccessNote &note) const {
  note.route = wanted.query.Has("zip") ? "zip" : "folder";
  return wanted.query.Has("zip") ? Zip(wanted, folder) : FolderPage(wanted, folder);
}

Response SharedAnswers::FolderPage(const SharedRequest &wanted, const share::Item &folder) const {
  const share::Order order = OrderOf(wanted.query);
  const std::optional<share::Listing> listing = share::ReadListing(tree_, folder, order);
  if (!listing) return answers_.Error(404);
  if (answers_.wants_json()) return answers_.Json(200, FolderDocument(wanted, *listing));
  FolderView view;
  view.link = view_.link;
  view.path = wanted.parts;
  for (const share::Entry &entry : listing->entries) view.entries.push_back(LineOf(entry));
  view.sort = ShownOrder(order.by);
  view.is_descending = order.is_descending;
  view.page = PageOf(wanted.query);
  view.is_incomplete = listing->left_out > 0;
  view.can_download = view_.can_download;
  return answers_.Page(200, pages_.Folder(view_.reader, view));
}

Response SharedAnswers::Zip(const SharedRequest &wanted, const share::Item &folder) const {
  if (!view_.can_download) return answers_.Error(404);
  std::optional<Response> zip = share::MakeZip(tree_, folder, wanted.query.All("name"));
  return zip ? std::move(*zip) : answers_.Error(404);
}

Response SharedAnswers::File(const SharedRequest &wanted, share::Item file,
                             AccessNote &note) const {
  for (const char *route : {"download", "view", "thumbnail"}) {
    if (!wanted.query.Has(route)) continue;
    note.route = route;
    if (note.route == "download") return Download(wanted, std::move(file));
    if (note.route == "view") return View(wanted, std::move(file));
    return Thumbnail(wanted, file);
  }
  note.route = "file";
  return answers_.wants_json() ? answers_.Json(200, FileDocument(file)) : FilePage(file);
}

Response SharedAnswers::FilePage(const share::Item &file) const {
  const share::PreviewKind preview = share::PreviewOf(file);
  FileView view;
  view.link = view_.link;
  view.path = file.parts;
  view.name = file.name;
  view.kind = KindOf(file.name, preview);
  view.media_type = share::MediaTypeByName(file.name);
  view.size = static_cast<uint64_t>(file.size);
  view.modified = file.changed.tv_sec;
  view.can_view = IsShownByBrowser(preview);
  view.can_download = view_.can_download;
  if (preview == share::PreviewKind::TEXT) AddText(file, view);
  AddNeighbours(file, view);
  return answers_.Page(200, pages_.File(view_.reader, view));
}

void SharedAnswers::AddText(const share::Item &file, FileView &view) const {
  std::optional<share::TextStart> start = share::ReadText(file, Pages::kTextPreviewBytes);
  if (!start) return;
  view.text = std::move(start->text);
  view.text_is_cut = start->is_cut;
}

void SharedAnswers::AddNeighbours(const share::Item &file, FileView &view) const {
  if (file.parts.empty()) return;
  const std::optional<share::Item> folder = tree_.Find({file.parts.begin(), file.parts.end() - 1});
  if (!folder) return;
  const std::optional<share::Listing> listing = share::ReadListing(tree_, *folder, {});
  if (!listing) return;
  std::string before;
  bool is_behind = false;
  for (const share::Entry &entry : listing->entries) {
    if (entry.is_folder) continue;
    if (is_behind) {
      view.next = entry.name;
      return;
    }
    is_behind = entry.name == file.parts.back();
    if (is_behind) view.previous = before;
    before = entry.name;
  }
}

Response SharedAnswers::Download(const SharedRequest &wanted, share::Item file) const {
  if (!view_.can_download) return answers_.Error(404);
  return share::Download(std::move(file), wanted.request, share::Purpose::SAVE);
}

Response SharedAnswers::View(const SharedRequest &wanted, share::Item file) const {
  if (!view_.can_download && !IsShownByBrowser(share::PreviewOf(file))) return answers_.Error(404);
  Response response = share::Download(std::move(file), wanted.request, share::Purpose::VIEW);
  // What a browser would save after all is a download.
  if (!view_.can_download && IsAttachment(response)) return answers_.Error(404);
  return response;
}

Response SharedAnswers::Thumbnail(const SharedRequest &wanted, const share::Item &file) const {
  std::optional<Response> thumbnail = share::ThumbnailResponse(file, wanted.request);
  return thumbnail ? std::move(*thumbnail) : answers_.Error(404);
}

Json::Value SharedAnswers::FolderDocument(const SharedRequest &wanted,
                                          const share::Listing &listing) const {
  Json::Value document = Document();
  document["type"] = "folder";
  document["is_incomplete"] = listing.left_out > 0;
  Json::Value &entries = document["entries"] = Json::Value(Json::arrayValue);
  for (const share::Entry &entry : listing.entries) {
    std::vector<std::string> parts = wanted.parts;
    parts.push_back(entry.name);
    Json::Value &line = entries.append(Json::objectValue);
    line["name"] = entry.name;
    line["type"] = entry.is_folder ? "folder" : "file";
    line["address"] = view_.address + JoinPath(parts);
    line["size"] = static_cast<Json::Int64>(entry.size);
    line["modified"] = static_cast<Json::Int64>(entry.changed);
  }
  return document;
}

Json::Value SharedAnswers::FileDocument(const share::Item &file) const {
  Json::Value document = Document();
  document["type"] = "file";
  document["file"] = file.name;
  document["address"] = view_.address + JoinPath(file.parts);
  document["size"] = static_cast<Json::Int64>(file.size);
  document["modified"] = static_cast<Json::Int64>(file.changed.tv_sec);
  return document;
}

Json::Value SharedAnswers::Document() const {
  Json::Value document = JsonOf({VELK_SHARING_AUTH_OK, AuthResultName(VELK_SHARING_AUTH_OK)});
  document["title"] = view_.link.title;
  if (!view_.link.continue_to.empty()) document["redirect"] = view_.link.continue_to;
  return document;
}

}  // namespace web
