#ifndef VELKSHARING_WEB_SITE_SITE_H
#define VELKSHARING_WEB_SITE_SITE_H

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "gate/guarded_prefix.h"
#include "http/request.h"
#include "http/response.h"

namespace web {

class SitePrivate;

/// What a site decides. Texts are checked by whoever reads the configuration.
struct SiteSettings {
  /// Where the links lie: begins with a slash, has none at its end; "" for the root. Letters,
  /// digits and "-._~/".
  std::string base_path = "/sharing";
  /// Folder of the site's own texts, colours and templates; "" for none.
  std::string site_folder;
  /// Stands at the head of each page; "" for the catalogue's word.
  std::string product_name;
  /// An existing folder that only this program writes to, the same for every process that serves
  /// the same database: locks lie there.
  std::string runtime_folder;
  /// At least 32 random bytes, the same for every process that serves the same visitors: the forms
  /// of one are taken by the others. Where each request has a process of its own (plain CGI) it
  /// must outlive these. A secret.
  std::string form_secret;
  /// Seconds after which a blocked visitor is told to try again.
  long retry_after = 600;
  /// Whether links guard addresses of other servers, who ask here.
  bool has_gate = false;
  /// What links guard by the configuration's word; by their own they may guard more.
  std::vector<gate::GuardedPrefix> guarded{};
};

/// What the access log, the counters and the audit trail may say about a request: nothing secret,
/// nothing that opens a link.
struct AccessNote {
  /// A visitor's coming and going, which the audit trail keeps.
  enum class Event {
    NONE,
    LOGIN,  ///< The access API was asked to log a visitor in who had to show something.
    ENTER,  ///< The same for a link that asks for nothing.
    LOGOUT
  };

  /// What the request was about: one of kRouteNames (site/route_names.h).
  std::string route = "none";
  /// The link's hash, shortened to its first three characters and "…" (less of a hash that is
  /// short); "" for none. The shared path is left out: file names are the owner's business.
  std::string link;
  /// Result code of the access API, 1 for success; 0 when it was not asked.
  int code = 0;
  /// The code's name in velksharing/access.h; "" when it was not asked.
  std::string code_name;
  /// What `code` answers, when it was a coming or going.
  Event event = Event::NONE;
  /// Row id of the link that it was about; 0 for none.
  int entry_id = 0;
  /// Account of the session that was made or left; none where a link asks for no account.
  std::optional<unsigned int> uid;
};

/// The visitors' side of every link: a request goes in, a response comes out. It knows no server.
///
///     Site site(settings);               // in each worker process
///     std::string error;
///     if (!site.Reload(error)) Log(error);
///     AccessNote note;
///     Response response = site.Handle(request, note);
///     Wipe(request.body);                // may have held a password
///
/// Belongs to one thread, and the process has one: the library has one connection. That is made by
/// the first Handle(), so a process that forks does so before. Files are opened with the file
/// system ids of their links' owners where the process has the capabilities for it.
class Site {
 public:
  explicit Site(SiteSettings settings);
  Site(const Site &) = delete;
  Site &operator=(const Site &) = delete;
  ~Site();

  /// Answers a request. The response has every header field but those of its length and its
  /// connection; a HEAD is answered as its GET, body included, which is not to be sent. Throws
  /// nothing: what goes wrong inside is logged and answered with 500.
  /// @param note replaced.
  Response Handle(const Request &request, AccessNote &note);

  /// An answer for a request that could not even be read (400, 408, 413, 414, 431 …): a page, or
  /// JSON where the head that came says so. It has the header fields of every other answer.
  Response Refuse(const Request &request, int status) const;

  /// Reads the site's own texts, colours and templates anew.
  /// @param[out] error on failure: one line; everything stays as it was.
  bool Reload(std::string &error);

  /// Whether the first Handle() could not open the database. The library tries once in a process,
  /// so the worker should end after this answer and be replaced.
  bool NeedsNewProcess() const;

 private:
  std::unique_ptr<SitePrivate> private_;
};

}  // namespace web

#endif
