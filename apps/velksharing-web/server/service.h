#ifndef VELKSHARING_WEB_SERVER_SERVICE_H
#define VELKSHARING_WEB_SERVER_SERVICE_H

#include <chrono>
#include <condition_variable>
#include <mutex>

#include "server/access_log.h"
#include "server/settings.h"
#include "site/site.h"
#include "watch/witness.h"

namespace web {

/// What a worker process answers requests with, whatever they come in by: the site, to which one
/// request at a time gets, the access log, and the count of what is being worked on. Any thread may
/// call.
///
///     service.Begin();
///     Response response = service.Answer(request, visit.note);
///     …send it, which holds up nobody…
///     service.End(visit);
class Service {
 public:
  /// @param form_secret as in SiteSettings.
  /// @param witness is told of every request; must outlive this. Null for nobody.
  Service(const Settings &settings, std::string form_secret, watch::Witness *witness = nullptr);

  /// Opens the access log and reads the site's texts and templates, or does it again. What cannot
  /// be had stays as it was; the log says so.
  /// @return whether all of it could be had.
  bool Load();

  /// A request has begun to come in.
  void Begin();
  /// A request is over: a line for the access log, and the witness is told.
  void End(const Visit &visit);
  /// What was begun turned out to be no request.
  void Drop();

  /// Answers a request, wipes its body, and tells the witness who came or went. Asks this process
  /// to stop when it has to be replaced.
  Response Answer(Request &request, AccessNote &note);
  /// As Site::Refuse().
  Response Refuse(const Request &request, int status);

  /// From now on connections are not kept.
  void BeginStop();
  bool IsStopping() const;
  /// Waits until nothing is being worked on.
  /// @return false when the time is up first.
  bool WaitUntilIdle(std::chrono::seconds timeout);

  /// What the worker exits with.
  int ExitStatus() const;

 private:
  Response Handle(Request &request, AccessNote &note);

  mutable std::mutex site_mutex_;
  Site site_;
  AccessLog log_;
  watch::Witness *const witness_;
  const watch::AddressForm address_form_;

  mutable std::mutex count_mutex_;
  std::condition_variable is_idle_;
  int running_ = 0;
  bool is_stopping_ = false;
};

}  // namespace web

#endif
