#include "pages/page_data.h"

#include <array>

#include "pages/shown_text.h"

namespace web {
namespace {

/// For machines: "2026-11-21T17:24:00Z"; "" for a time that no calendar has.
std::string IsoTime(time_t time) {
  struct tm parts = {};
  if (gmtime_r(&time, &parts) == nullptr) return "";
  std::array<char, 64> text = {};
  return std::string(text.data(), strftime(text.data(), text.size(), "%FT%TZ", &parts));
}

Data Crumb(std::string_view name, std::string_view address) {
  Data crumb;
  crumb.set("name", std::string(name));
  SetOrFalse(crumb, "href", address);
  return crumb;
}

}  // namespace

std::string TitleOf(const LinkView &link, const Catalogue &texts) {
  return link.title.empty() ? texts.Text("default_title") : ShownName(link.title);
}

std::string_view HostOf(std::string_view address) {
  address.remove_prefix(std::min(address.find("//") + 2, address.size()));
  address = address.substr(0, address.find_first_of("/\\?#"));
  const size_t user = address.rfind('@');
  return user == std::string_view::npos ? address : address.substr(user + 1);
}

void SetOrFalse(Data &data, const std::string &name, std::string_view text) {
  if (text.empty()) {
    SetFlag(data, name, false);
  } else {
    data.set(name, std::string(text));
  }
}

void SetFlag(Data &data, const std::string &name, bool value) {
  data.set(name, value ? Data::type::bool_true : Data::type::bool_false);
}

void SetCrumbs(Data &data, const LinkView &link, const std::vector<std::string> &path,
               const PageTools &tools) {
  Data crumbs(Data::type::list);
  crumbs.push_back(Crumb(TitleOf(link, tools.texts), tools.addresses.Link(link.hash)));
  for (size_t depth = 1; depth < path.size(); ++depth) {
    const std::vector<std::string> above(path.begin(), path.begin() + static_cast<long>(depth));
    crumbs.push_back(Crumb(ShownName(above.back()), tools.addresses.Folder(link.hash, above)));
  }
  if (!path.empty()) crumbs.push_back(Crumb(ShownName(path.back()), ""));
  data.set("crumbs", crumbs);
  SetFlag(data, "has_path", !path.empty());
}

void SetDate(Data &data, time_t time, const Catalogue &texts) {
  SetOrFalse(data, "date", texts.Time(time));
  SetOrFalse(data, "iso_date", IsoTime(time));
}

void SetContinue(Data &data, const LinkView &link, const Catalogue &texts) {
  const std::string_view target = WebAddressOnly(link.continue_to);
  SetOrFalse(data, "continue_to", target);
  const std::string host = ShownName(HostOf(target));
  data.set("continue_label", texts.Text("continue_to", {{"host", host}}));
}

const char *KindName(FileKind kind) {
  switch (kind) {
    case FileKind::kFolder:
      return "folder";
    case FileKind::kImage:
      return "image";
    case FileKind::kText:
      return "text";
    case FileKind::kAudio:
      return "audio";
    case FileKind::kVideo:
      return "video";
    case FileKind::kPdf:
      return "pdf";
    case FileKind::kArchive:
      return "archive";
    case FileKind::kOther:
      break;
  }
  return "other";
}

}  // namespace web
