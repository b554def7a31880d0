#include <algorithm>
#include <string>
#include <utility>

#include "http/percent.h"
#include "pages/page_data.h"
#include "pages/pages.h"
#include "pages/shown_text.h"

namespace web {
namespace {

struct Column {
  SortBy sort;
  const char *name;
  bool starts_descending;  ///< Largest and newest first is what one looks for.
};

constexpr Column kColumns[] = {
    {SortBy::kName, "name", false}, {SortBy::kSize, "size", true}, {SortBy::kDate, "date", true}};

const char *ColumnName(SortBy sort) {
  const auto *column = std::find_if(std::begin(kColumns), std::end(kColumns),
                                    [sort](const Column &known) { return known.sort == sort; });
  return column->name;
}

std::string OrderQuery(const std::string &column, bool is_descending) {
  return "?sort=" + column + "&order=" + (is_descending ? "desc" : "asc");
}

Data ColumnData(const Column &column, const FolderView &view, const std::string &folder,
                const Catalogue &texts) {
  const bool is_current = view.sort == column.sort;
  const bool is_next_descending = is_current ? !view.is_descending : column.starts_descending;
  const std::string name = column.name;
  Data data;
  data.set("class", name);
  data.set("label", texts.Text("column_" + name));
  data.set("href", folder + OrderQuery(name, is_next_descending));
  const char *direction = view.is_descending ? "descending" : "ascending";
  SetOrFalse(data, "direction", is_current ? direction : "");
  return data;
}

Data EntryData(const FolderEntry &entry, const FolderView &view, const std::string &folder,
               const Catalogue &texts) {
  const bool is_folder = entry.kind == FileKind::kFolder;
  const std::string name = ShownName(entry.name);
  const std::string address = folder + "/" + PercentEncode(entry.name) + (is_folder ? "/" : "");
  Data data;
  data.set("name", name);
  data.set("href", address);
  data.set("kind", std::string(KindName(entry.kind)));
  SetFlag(data, "is_folder", is_folder);
  data.set("size", is_folder ? "" : texts.Size(entry.size));
  SetDate(data, entry.modified, texts);
  data.set("thumbnail", address + "?thumbnail");
  if (!view.can_download) return data;

  data.set("download", address + (is_folder ? "?zip" : "?download"));
  data.set("download_label", texts.Text("download_one", {{"name", name}}));
  SetFlag(data, "selectable", SurvivesForms(entry.name));
  data.set("bytes", entry.name);
  data.set("select_label", texts.Text("select", {{"name", name}}));
  return data;
}

std::string Summary(const FolderView &view, const Catalogue &texts) {
  uint64_t bytes = 0;
  for (const FolderEntry &entry : view.entries) {
    if (entry.kind != FileKind::kFolder) bytes += entry.size;
  }
  std::string summary = texts.Count("items", view.entries.size());
  if (bytes > 0) summary += " · " + texts.Size(bytes);
  return summary;
}

/// Which part of a folder a page shows.
struct Part {
  size_t page = 1;
  size_t pages = 1;
  std::vector<FolderEntry>::const_iterator begin;
  std::vector<FolderEntry>::const_iterator end;
};

Part PartOf(const FolderView &view) {
  constexpr size_t kSize = Pages::kEntriesPerPage;
  const size_t count = view.entries.size();
  Part part;
  part.pages = std::max<size_t>(1, (count + kSize - 1) / kSize);
  part.page = std::clamp<size_t>(view.page, 1, part.pages);
  const auto at = [&](size_t page) {
    return view.entries.begin() + static_cast<long>(std::min(page * kSize, count));
  };
  part.begin = at(part.page - 1);
  part.end = at(part.page);
  return part;
}

/// Sets both lists of a page: all of its entries, and the images among them.
void SetEntries(Data &data, const FolderView &view, const Part &part, const std::string &folder,
                const Catalogue &texts) {
  Data entries(Data::type::list);
  Data images(Data::type::list);
  size_t image_count = 0;
  for (auto entry = part.begin; entry != part.end; ++entry) {
    const Data line = EntryData(*entry, view, folder, texts);
    entries.push_back(line);
    if (!entry->has_thumbnail) continue;
    images.push_back(line);
    ++image_count;
  }
  data.set("entries", entries);
  SetFlag(data, "has_entries", !view.entries.empty());
  SetFlag(data, "is_empty", view.entries.empty());
  data.set("images", images);
  SetFlag(data, "has_images", image_count > 0);
  data.set("images_heading", texts.Count("images", image_count));
}

/// Sets the ways to the pages before and behind.
void SetTurning(Data &data, const FolderView &view, const Part &part, const std::string &folder,
                const Catalogue &texts) {
  const auto page = [&](size_t number) {
    if (number < 1 || number > part.pages) return std::string();
    return folder + OrderQuery(ColumnName(view.sort), view.is_descending) +
           "&page=" + std::to_string(number);
  };
  SetFlag(data, "has_pages", part.pages > 1);
  SetOrFalse(data, "previous_page", page(part.page - 1));
  SetOrFalse(data, "next_page", page(part.page + 1));
  data.set("page_of", texts.Text("page_of", {{"page", texts.Number(part.page)},
                                             {"pages", texts.Number(part.pages)}}));
}

}  // namespace

Data FolderData(const FolderView &view, const PageTools &tools) {
  const Catalogue &texts = tools.texts;
  const std::string address = tools.addresses.Folder(view.link.hash, view.path);
  const std::string above_entries = tools.addresses.File(view.link.hash, view.path);

  Data data;
  data.set("heading", view.path.empty() ? TitleOf(view.link, texts) : ShownName(view.path.back()));
  data.set("summary", Summary(view, texts));
  data.set("folder", address);
  SetCrumbs(data, view.link, view.path, tools);
  SetContinue(data, view.link, texts);
  SetFlag(data, "is_incomplete", view.is_incomplete);
  SetFlag(data, "can_download", view.can_download);
  const bool can_zip = view.can_download && !view.entries.empty();
  SetOrFalse(data, "zip", can_zip ? address + "?zip" : "");

  Data columns(Data::type::list);
  for (const Column &column : kColumns) {
    columns.push_back(ColumnData(column, view, address, texts));
  }
  data.set("columns", columns);
  const Part part = PartOf(view);
  SetEntries(data, view, part, above_entries, texts);
  SetTurning(data, view, part, address, texts);
  return data;
}

}  // namespace web
