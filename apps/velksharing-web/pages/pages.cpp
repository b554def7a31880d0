#include "pages/pages.h"

#include <utility>

#include "pages/content.h"
#include "pages/language_choice.h"
#include "pages/page_data.h"
#include "pages/shown_text.h"

namespace web {
namespace {

/// What the frame around a page needs to know of it.
struct Frame {
  std::string page;  ///< The template, and the style sheet's name for the page.
  std::string window_title;
  LinkView link;        ///< Without a hash for pages that belong to none.
  std::string refresh;  ///< Where the page goes on to by itself; "" when it stays.
};

/// The link as it is for those who are not in: there is nothing to leave.
LinkView FromOutside(LinkView link) {
  link.can_log_out = false;
  return link;
}

/// Seconds as the catalogue says them, rounded up to what people count in.
std::string RetryText(const Catalogue &texts, long seconds) {
  constexpr long kMinute = 60;
  constexpr long kHour = 60 * kMinute;
  constexpr long kDay = 24 * kHour;
  const auto in = [&](const char *key, long unit) {
    return texts.Count(key, static_cast<uint64_t>((seconds - 1) / unit + 1));
  };
  if (seconds <= 0) return "";
  if (seconds < kMinute) return texts.Text("retry_soon");
  if (seconds <= 2 * kHour) return in("retry_minutes", kMinute);
  if (seconds <= 2 * kDay) return in("retry_hours", kHour);
  return in("retry_days", kDay);
}

std::string ProblemText(const Catalogue &texts, LoginProblem problem) {
  switch (problem) {
    case LoginProblem::kRefused:
      return texts.Text("login_problem");
    case LoginProblem::kFormExpired:
      return texts.Text("login_form_expired");
    case LoginProblem::kNone:
      break;
  }
  return "";
}

/// The beginning of a message's keys: of the status itself, or of its hundred.
std::string MessageKey(const Catalogue &texts, int status) {
  const std::string key = "message_" + std::to_string(status);
  if (texts.texts().count(key + "_title") > 0) return key;
  return status / 100 == 4 ? "message_4xx" : "message_5xx";
}

}  // namespace

class PagesPrivate {
 public:
  explicit PagesPrivate(PagesSettings given)
      : settings(std::move(given)), addresses(settings.base_path) {
    std::string error;
    content = Content::Make({}, error);
  }

  const Catalogue &Texts(const Reader &reader) const { return content->Texts(reader.language); }

  /// The whole document: the page's own template in the frame that all pages share.
  std::string Document(const Reader &reader, const Frame &frame, Data page) const {
    const Data &texts = content->TextData(reader.language);
    const std::string icons = addresses.Asset(content->AssetName("icons.svg"));
    page.set("icons", icons);
    page.set("csrf", reader.csrf);
    Data document = FrameData(reader, frame);
    document.set("icons", icons);
    document.set("content", content->templates().Render(frame.page, page, texts));
    return content->templates().Render("layout", document, texts);
  }

  /// One of the three pages in front of a link.
  std::string Login(const Reader &reader, const std::string &page, const LoginView &view) const {
    const Catalogue &texts = Texts(reader);
    Data data;
    data.set("title", TitleOf(view.link, texts));
    data.set("action", addresses.Login(view.link.hash, view.return_to));
    SetOrFalse(data, "problem", ProblemText(texts, view.problem));
    SetFlag(data, "is_refused", view.problem == LoginProblem::kRefused);
    data.set("account", ShownName(view.account));
    SetFlag(data, "account_known", !view.account.empty());
    data.set("password_field", settings.password_field);
    data.set("account_field", settings.account_field);
    data.set("account_password_field", settings.account_password_field);
    return Document(reader, {page, texts.Text(page + "_window"), FromOutside(view.link), ""}, data);
  }

  const PagesSettings settings;
  const Addresses addresses;
  std::unique_ptr<const Content> content;

 private:
  Data FrameData(const Reader &reader, const Frame &frame) const {
    const std::string product = Product(reader);
    Data data;
    data.set("page", frame.page);
    data.set("window_title", frame.window_title + " · " + product);
    data.set("product", product);
    SetOrFalse(data, "refresh", frame.refresh);
    data.set("favicon", addresses.Asset(content->AssetName("favicon.svg")));
    data.set("style", addresses.Asset(content->AssetName("style.css")));
    SetAsset(data, "site_style", "site.css");
    SetAsset(data, "logo", "logo");
    SetFlag(data, "can_log_out", frame.link.can_log_out);
    data.set("logout", addresses.Logout(frame.link.hash));
    data.set("csrf", reader.csrf);
    return data;
  }

  std::string Product(const Reader &reader) const {
    const std::string &name = settings.product_name;
    return name.empty() ? Texts(reader).Text("product") : ShownName(name);
  }

  void SetAsset(Data &data, const std::string &name, std::string_view file_name) const {
    const std::string asset = content->AssetName(file_name);
    SetOrFalse(data, name, asset.empty() ? "" : addresses.Asset(asset));
  }
};

Pages::Pages(PagesSettings settings)
    : private_(std::make_unique<PagesPrivate>(std::move(settings))) {}

Pages::~Pages() = default;

bool Pages::Reload(std::string &error) {
  const std::string &folder = private_->settings.site_folder;
  if (folder.empty()) return true;
  SourceFiles site;
  std::unique_ptr<const Content> content;
  if (ReadSiteFolder(folder, site, error)) content = Content::Make(site, error);
  if (content == nullptr) {
    error = folder + ": " + error;
    return false;
  }
  private_->content = std::move(content);
  return true;
}

std::string Pages::ChooseLanguage(std::string_view accept_language) const {
  return ChooseAmong(private_->content->languages(), accept_language);
}

std::string Pages::Password(const Reader &reader, const LoginView &view) const {
  return private_->Login(reader, "password", view);
}

std::string Pages::Account(const Reader &reader, const LoginView &view) const {
  return private_->Login(reader, "account", view);
}

std::string Pages::Open(const Reader &reader, const LoginView &view) const {
  return private_->Login(reader, "open", view);
}

std::string Pages::Continue(const Reader &reader, const LinkView &link,
                            const std::string &target) const {
  const Catalogue &texts = private_->Texts(reader);
  const std::string address(WebAddressOnly(target));
  const std::string host = ShownName(HostOf(address));
  Data data;
  data.set("target", address.empty() ? private_->addresses.Link(link.hash) : address);
  SetOrFalse(data, "hint", host.empty() ? "" : texts.Text("continue_hint", {{"host", host}}));
  return private_->Document(reader, {"continue", texts.Text("continue_window"), link, address},
                            data);
}

std::string Pages::Guarded(const Reader &reader, const std::string &login) const {
  Data data;
  data.set("login", login);
  const std::string title = private_->Texts(reader).Text("guarded_window");
  return private_->Document(reader, {"guarded", title, {}, login}, data);
}

std::string Pages::Folder(const Reader &reader, const FolderView &view) const {
  const Catalogue &texts = private_->Texts(reader);
  const std::string name =
      view.path.empty() ? TitleOf(view.link, texts) : ShownName(view.path.back());
  return private_->Document(reader, {"folder", name, view.link, ""},
                            FolderData(view, {private_->addresses, texts}));
}

std::string Pages::File(const Reader &reader, const FileView &view) const {
  return private_->Document(reader, {"file", ShownName(view.name), view.link, ""},
                            FileData(view, {private_->addresses, private_->Texts(reader)}));
}

std::string Pages::Leave(const Reader &reader, const LinkView &link) const {
  const Catalogue &texts = private_->Texts(reader);
  Data data;
  data.set("title", TitleOf(link, texts));
  data.set("logout", private_->addresses.Logout(link.hash));
  data.set("back", private_->addresses.Link(link.hash));
  return private_->Document(reader, {"leave", texts.Text("leave_window"), FromOutside(link), ""},
                            data);
}

std::string Pages::LoggedOut(const Reader &reader, const LinkView &link) const {
  Data data;
  data.set("action", private_->addresses.Link(link.hash));
  const std::string title = private_->Texts(reader).Text("logged_out_window");
  return private_->Document(reader, {"logged_out", title, FromOutside(link), ""}, data);
}

std::string Pages::Message(const Reader &reader, int status, long retry_after) const {
  const Catalogue &texts = private_->Texts(reader);
  const std::string key = MessageKey(texts, status);
  const std::string title = texts.Text(key + "_title");
  Data data;
  data.set("title", title);
  data.set("hint", texts.Text(key + "_hint"));
  data.set("status", std::to_string(status));
  SetOrFalse(data, "retry", RetryText(texts, retry_after));
  return private_->Document(reader, {"message", title, {}, ""}, data);
}

const Asset *Pages::FindAsset(std::string_view name) const {
  return private_->content->assets().Find(name);
}

}  // namespace web
