#include "server/service.h"

#include <syslog.h>
#include <unistd.h>

#include <csignal>

#include "http/wipe.h"
#include "server/testimony.h"

namespace web {
namespace {

constexpr int kDone = 0;
constexpr int kReplaceMe = 4;

SiteSettings ForSite(const Settings &settings, std::string form_secret) {
  SiteSettings site;
  site.base_path = settings.path;
  site.site_folder = settings.site_folder;
  site.product_name = settings.product_name;
  site.runtime_folder = settings.runtime_folder;
  site.form_secret = std::move(form_secret);
  site.retry_after = settings.retry_after;
  site.has_gate = settings.auth_address != AuthAddress::OFF;
  site.guarded = settings.guarded;
  return site;
}

}  // namespace

Service::Service(const Settings &settings, std::string form_secret, watch::Witness *witness)
    : site_(ForSite(settings, std::move(form_secret))),
      log_(settings.access_log),
      witness_(witness),
      address_form_(settings.audit_address) {}

bool Service::Load() {
  std::string error;
  const bool has_log = log_.Open(error);
  if (!has_log) syslog(LOG_ERR, "%s", error.c_str());
  const std::lock_guard guard(site_mutex_);
  const bool has_texts = site_.Reload(error);
  if (!has_texts) syslog(LOG_ERR, "%s", error.c_str());
  return has_log && has_texts;
}

void Service::Begin() {
  const std::lock_guard guard(count_mutex_);
  ++running_;
}

void Service::End(const Visit &visit) {
  log_.Write(visit);
  if (witness_ != nullptr) witness_->Count(FinishedOf(visit));
  Drop();
}

void Service::Drop() {
  const std::lock_guard guard(count_mutex_);
  if (--running_ == 0) is_idle_.notify_all();
}

Response Service::Answer(Request &request, AccessNote &note) {
  Response response = Handle(request, note);
  if (witness_ == nullptr) return response;
  const auto record = AuditRecordOf(note, request.remote_address, address_form_);
  if (record) witness_->Keep(*record);
  return response;
}

Response Service::Handle(Request &request, AccessNote &note) {
  const std::lock_guard guard(site_mutex_);
  Response response = site_.Handle(request, note);
  Wipe(request.body);
  if (site_.NeedsNewProcess()) kill(getpid(), SIGTERM);
  return response;
}

Response Service::Refuse(const Request &request, int status) {
  const std::lock_guard guard(site_mutex_);
  return site_.Refuse(request, status);
}

void Service::BeginStop() {
  const std::lock_guard guard(count_mutex_);
  is_stopping_ = true;
}

bool Service::IsStopping() const {
  const std::lock_guard guard(count_mutex_);
  return is_stopping_;
}

bool Service::WaitUntilIdle(std::chrono::seconds timeout) {
  std::unique_lock lock(count_mutex_);
  return is_idle_.wait_for(lock, timeout, [this] { return running_ == 0; });
}

int Service::ExitStatus() const {
  const std::lock_guard guard(site_mutex_);
  return site_.NeedsNewProcess() ? kReplaceMe : kDone;
}

}  // namespace web
