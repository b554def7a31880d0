#ifndef VELKSHARING_WEB_PAGES_PAGES_H
#define VELKSHARING_WEB_PAGES_PAGES_H

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

#include "pages/views.h"

namespace web {

class PagesPrivate;

/// What a site decides about its pages.
struct PagesSettings {
  std::string base_path =
      "/sharing";  ///< Where the links lie; no slash at the end; "" for the root.
  std::string
      site_folder{};  ///< Folder of the site's own texts, colours and templates; "" for none.
  std::string product_name{};  ///< Stands at the head of each page; "" for the catalogue's word.
  // Names of the fields of the login forms.
  std::string password_field = "password";
  std::string account_field = "zed_username";
  std::string account_password_field = "zed_password";
};

/// A file that pages refer to: style sheet, icons, the site's logo.
struct Asset {
  std::string type{};  ///< For Content-Type: "text/css; charset=utf-8".
  std::string bytes{};
};

/// Writes the visitors' pages: HTML without script, in the visitor's language.
///
///     Pages pages({.base_path = "/sharing", .site_folder = "/usr/velk/etc/sharing-web"});
///     std::string error;
///     if (!pages.Reload(error)) Log(error);  // and go on with what there was
///     Reader reader{pages.ChooseLanguage(request.headers.Get("Accept-Language")), csrf};
///     response.body = pages.Password(reader, {.link = {.hash = hash, .title = title}});
///
/// Every page is a whole document in UTF-8, to be sent as kContentType with
/// kContentSecurityPolicy. It depends on its arguments and on what was loaded last, and on nothing
/// else (times are in the process's time zone): equal arguments give equal bytes.
///
/// Forms and links go to these addresses, relative to the base path:
///
///     POST HASH                login; fields as in PagesSettings, and csrf
///     POST HASH/logout         csrf
///     GET  HASH[/sub/folder/]  ?sort=name|size|date&order=asc|desc&page=N
///                              ?zip       the whole folder
///                              ?zip=&name=A&name=B   what is ticked (a form sends "zip=")
///     GET  HASH[/sub/file]     ?download ?view ?thumbnail
///     GET  -/NAME              an asset
///
/// Belongs to one thread.
class Pages {
 public:
  /// The type of every page.
  static constexpr std::string_view kContentType = "text/html; charset=utf-8";

  /// What the pages need and no more. An inline PDF (`?view`) is framed by its preview page, so
  /// that answer needs `frame-ancestors 'self'`, and no `sandbox`, where others say 'none'.
  /// Browsers apply form-action to redirects that follow a post, too: answer a login that leads
  /// off the site with Continue().
  static constexpr std::string_view kContentSecurityPolicy =
      "default-src 'none'; style-src 'self'; img-src 'self'; media-src 'self'; "
      "frame-src 'self'; form-action 'self'; base-uri 'none'; frame-ancestors 'none'";

  /// How much of a text file its preview shows, at most.
  static constexpr size_t kTextPreviewBytes = 256 * 1024;

  /// How many entries of a folder one page shows.
  static constexpr size_t kEntriesPerPage = 500;

  /// The pages as they are built in; Reload() brings the site's own.
  explicit Pages(PagesSettings settings);
  Pages(const Pages &) = delete;
  Pages &operator=(const Pages &) = delete;
  ~Pages();

  /// Reads the site's folder anew: templates/NAME.mustache, catalogues/LANGUAGE.json, style.css,
  /// logo.svg or logo.png. All of it or nothing: when anything cannot be used, everything stays as
  /// it was before. What the folder lacks is as it is built in.
  /// @param[out] error on failure: which file, and what is wrong with it; one line, no line end.
  /// @return whether the site's folder is in use now; true when the settings name none.
  bool Reload(std::string &error);

  /// The language of the visitor, among those of the catalogues: "en", "de" and the site's.
  /// English when no other is wanted more; never fails, whatever the field says.
  std::string ChooseLanguage(std::string_view accept_language) const;

  /// Asks for the link's password.
  std::string Password(const Reader &reader, const LoginView &view) const;
  /// Asks for an account's name and password.
  std::string Account(const Reader &reader, const LoginView &view) const;
  /// Asks for one click: an open link that is not entered by looking at it.
  std::string Open(const Reader &reader, const LoginView &view) const;
  /// Says that the visitor is in, and goes on to `target` (http or https, checked by the caller)
  /// by itself. A target that is none leads back to the link.
  std::string Continue(const Reader &reader, const LinkView &link, const std::string &target) const;

  /// Says to somebody who asked for a guarded page that he has to log in, and goes on to the login
  /// page by itself.
  /// @param login path and query of that page, percent-encoded.
  std::string Guarded(const Reader &reader, const std::string &login) const;

  std::string Folder(const Reader &reader, const FolderView &view) const;
  std::string File(const Reader &reader, const FileView &view) const;

  /// Asks whether the visitor wants to leave: for a link without pages of its own to log out on.
  std::string Leave(const Reader &reader, const LinkView &link) const;
  /// Says that the visitor has left the link, and how to get back.
  std::string LoggedOut(const Reader &reader, const LinkView &link) const;

  /// Explains an answer that is an error.
  /// @param status the HTTP status; 400, 403, 404, 405, 408, 413, 414, 429, 431, 500 and 503 have
  ///        words of their own, others get those of their hundred.
  /// @param retry_after seconds until another try makes sense, shown in minutes; 0: not said.
  std::string Message(const Reader &reader, int status, long retry_after = 0) const;

  /// The asset of a name, as the pages write it: with a digest of its content, so that an answer
  /// may be kept for ever. Null when there is none; valid until the next Reload().
  const Asset *FindAsset(std::string_view name) const;

 private:
  std::unique_ptr<PagesPrivate> private_;
};

}  // namespace web

#endif
