#include "site/site.h"

#include <syslog.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>

#include <algorithm>
#include <exception>
#include <optional>
#include <string_view>
#include <utility>

#include "http/form.h"
#include "http/text.h"
#include "http/wipe.h"
#include "site/answers.h"
#include "site/cgi_environment.h"
#include "site/form_token.h"
#include "site/gatekeeper.h"
#include "site/guards.h"
#include "site/link.h"
#include "site/link_visit.h"
#include "site/routes.h"
#include "site/security_headers.h"

namespace web {
namespace {

constexpr size_t kLargestForm = 64 * 1024;

PagesSettings PagesSettingsOf(const SiteSettings &settings) {
  PagesSettings pages;
  pages.base_path = settings.base_path;
  pages.site_folder = settings.site_folder;
  pages.product_name = settings.product_name;
  pages.password_field = VELK::sharing::SZK_PASSWORD_;
  pages.account_field = VELK::sharing::SZK_ZED_USERNAME;
  pages.account_password_field = VELK::sharing::SZK_ZED_PASSWORD;
  return pages;
}

bool IsFormType(std::string_view content_type) {
  constexpr std::string_view kForm = "application/x-www-form-urlencoded";
  return IsSameText(Trimmed(TakePart(content_type, ';')), kForm);
}

Response PlainText(int status, const char *text) {
  Response response;
  response.status = status;
  response.headers.Add("Content-Type", "text/plain; charset=utf-8");
  response.body = text;
  return response;
}

bool IsReading(const Request &request) {
  return request.method == "GET" || request.method == "HEAD";
}

Response MethodNotAllowed(const Answers &answers, const char *allowed) {
  Response response = answers.Error(405);
  response.headers.Add("Allow", allowed);
  return response;
}

Response Health() {
  return DatabaseAnswers() ? PlainText(200, "ok\n") : PlainText(503, "the database is unusable\n");
}

}  // namespace

class SitePrivate {
 public:
  explicit SitePrivate(SiteSettings settings)
      : settings_(std::move(settings)),
        pages_(PagesSettingsOf(settings_)),
        tokens_(settings_.form_secret),
        guards_(settings_.guarded),
        gatekeeper_(settings_, pages_, guards_) {}
  ~SitePrivate() { Wipe(settings_.form_secret); }

  Response Answer(const Request &request, AccessNote &note);

  Pages &pages() { return pages_; }
  bool has_asked_database() const { return has_asked_database_; }

 private:
  Response AnswerAsset(const Answers &answers, const std::string &name) const;
  Response AnswerLink(const Answers &answers, const Request &request, const Route &route,
                      AccessNote &note) const;
  Response AnswerForm(const Answers &answers, const Request &request, const Route &route,
                      LinkVisit &visit) const;

  SiteSettings settings_;
  Pages pages_;
  const FormTokens tokens_;
  Guards guards_;
  const Gatekeeper gatekeeper_;
  bool has_asked_database_ = false;
};

Response SitePrivate::Answer(const Request &request, AccessNote &note) {
  const Answers answers(pages_, request);
  if (request.question) {
    has_asked_database_ = true;
    return gatekeeper_.Answer(answers, request, note);
  }
  const Route route = FindRoute(settings_.base_path, request.path);
  if (route.kind == Route::LINK) {
    has_asked_database_ = true;
    note.link = ShortenedHash(route.hash);
    return AnswerLink(answers, request, route, note);
  }
  if (!IsReading(request)) return MethodNotAllowed(answers, "GET, HEAD");
  if (route.kind == Route::NOWHERE) return answers.Error(404);
  if (route.kind == Route::ASSET) {
    note.route = "asset";
    return AnswerAsset(answers, route.parts.front());
  }
  has_asked_database_ = true;
  note.route = "health";
  return Health();
}

Response SitePrivate::AnswerAsset(const Answers &answers, const std::string &name) const {
  const Asset *asset = pages_.FindAsset(name);
  if (asset == nullptr) return answers.Error(404);
  Response response;
  response.headers.Add("Content-Type", asset->type);
  response.headers.Add("Cache-Control", "public, max-age=31536000, immutable");
  response.body = asset->bytes;
  return response;
}

Response SitePrivate::AnswerLink(const Answers &answers, const Request &request, const Route &route,
                                 AccessNote &note) const {
  const bool takes_forms = route.parts.empty() || route.IsLogout();
  if (!IsReading(request) && !(takes_forms && request.method == "POST"))
    return MethodNotAllowed(answers, takes_forms ? "GET, HEAD, POST" : "GET, HEAD");
  const PlatformRequest current(request);
  LinkVisit visit({settings_, pages_, tokens_, guards_}, answers, request, route.hash, note);
  if (!IsReading(request)) return AnswerForm(answers, request, route, visit);
  const std::optional<Form> query = Form::Parse(request.query);
  if (!query) return answers.Error(400);
  return visit.Look({request, *query, route.parts, route.ends_with_slash, route.IsLogout()});
}

Response SitePrivate::AnswerForm(const Answers &answers, const Request &request, const Route &route,
                                 LinkVisit &visit) const {
  if (request.body.size() > kLargestForm) return answers.Error(413);
  if (!request.body.empty() && !IsFormType(request.headers.Get("Content-Type")))
    return answers.Error(415);
  const std::optional<Form> form = Form::Parse(request.body);
  if (!form) return answers.Error(400);
  return route.IsLogout() ? visit.LogOut(*form) : visit.LogIn(*form);
}

Site::Site(SiteSettings settings) : private_(std::make_unique<SitePrivate>(std::move(settings))) {}

Site::~Site() = default;

Response Site::Handle(const Request &request, AccessNote &note) {
  note = {};
  try {
    Response response = private_->Answer(request, note);
    AddSecurityHeaders(response);
    return response;
  } catch (const std::exception &error) {
    syslog(LOG_ERR, "a request failed: %s", error.what());
    return Refuse(request, 500);
  }
}

Response Site::Refuse(const Request &request, int status) const {
  Response response = Answers(private_->pages(), request).Error(status);
  AddSecurityHeaders(response);
  return response;
}

bool Site::Reload(std::string &error) {
  return private_->pages().Reload(error);
}

bool Site::NeedsNewProcess() const {
  return private_->has_asked_database() && !VELK::sharing::db::SharingDB::Instance().IsGood();
}

}  // namespace web
