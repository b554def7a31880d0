#include <string>

#include "pages/page_data.h"
#include "pages/pages.h"
#include "pages/shown_text.h"

namespace web {
namespace {

/// What the page shows of the content; at most one of them.
enum class Preview { kNone, kImage, kAudio, kVideo, kPdf, kText };

Preview PreviewOf(const FileView &view) {
  if (view.text) return Preview::kText;
  if (!view.can_view) return Preview::kNone;
  switch (view.kind) {
    case FileKind::kImage:
      return Preview::kImage;
    case FileKind::kAudio:
      return Preview::kAudio;
    case FileKind::kVideo:
      return Preview::kVideo;
    case FileKind::kPdf:
      return Preview::kPdf;
    default:
      return Preview::kNone;
  }
}

void SetText(Data &data, const FileView &view, const Catalogue &texts) {
  std::string_view text = view.text ? std::string_view(*view.text) : std::string_view();
  const bool is_cut = view.text_is_cut || text.size() > Pages::kTextPreviewBytes;
  if (is_cut) text = WithoutCutCharacter(text.substr(0, Pages::kTextPreviewBytes));
  data.set("text", ShownText(text));
  SetFlag(data, "is_cut", is_cut);
  data.set("cut_hint", texts.Text("preview_cut", {{"size", texts.Size(view.size)}}));
}

void SetPreview(Data &data, const FileView &view, const std::string &address,
                const Catalogue &texts) {
  const Preview preview = PreviewOf(view);
  SetFlag(data, "is_image", preview == Preview::kImage);
  SetFlag(data, "is_audio", preview == Preview::kAudio);
  SetFlag(data, "is_video", preview == Preview::kVideo);
  SetFlag(data, "is_pdf", preview == Preview::kPdf);
  SetFlag(data, "is_text", preview == Preview::kText);
  SetFlag(data, "is_without_preview", preview == Preview::kNone);
  data.set("preview_label", texts.Text("preview", {{"name", ShownName(view.name)}}));
  SetOrFalse(data, "view", view.can_view ? address + "?view" : "");
  // Viewers offer to save what they show; where nothing is to be saved, their tools go.
  data.set("frame", address + (view.can_download ? "?view" : "?view#toolbar=0"));
  SetText(data, view, texts);
}

void SetNeighbour(Data &data, const std::string &which, const std::string &name,
                  const FileView &view, const PageTools &tools) {
  std::string address;
  if (!name.empty() && !view.path.empty()) {
    std::vector<std::string> path = view.path;
    path.back() = name;
    address = tools.addresses.File(view.link.hash, path);
  }
  SetOrFalse(data, which, address);
  data.set(which + "_label", tools.texts.Text("file_" + which, {{"name", ShownName(name)}}));
}

}  // namespace

Data FileData(const FileView &view, const PageTools &tools) {
  const Catalogue &texts = tools.texts;
  const std::string address = tools.addresses.File(view.link.hash, view.path);
  const std::string kind = KindName(view.kind);

  Data data;
  data.set("name", ShownName(view.name));
  data.set("kind", kind);
  data.set("kind_label", texts.Text("kind_" + kind));
  data.set("media_type", ShownName(view.media_type));
  data.set("size", texts.Size(view.size));
  SetDate(data, view.modified, texts);
  SetOrFalse(data, "download", view.can_download ? address + "?download" : "");
  SetCrumbs(data, view.link, view.path, tools);
  SetContinue(data, view.link, texts);
  SetPreview(data, view, address, texts);
  SetNeighbour(data, "previous", view.previous, view, tools);
  SetNeighbour(data, "next", view.next, view, tools);
  SetFlag(data, "has_neighbours",
          !view.path.empty() && !(view.previous.empty() && view.next.empty()));
  return data;
}

}  // namespace web
