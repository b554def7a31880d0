#ifndef VELKSHARING_WEB_SITE_GATEKEEPER_H
#define VELKSHARING_WEB_SITE_GATEKEEPER_H

#include <string>
#include <vector>

#include "gate/address.h"
#include "http/request.h"
#include "http/response.h"
#include "site/access.h"
#include "site/answers.h"
#include "site/guards.h"
#include "site/site.h"

namespace web {

/// Answers web servers that ask whether a visitor may see something of theirs.
///
/// Closed unless clearly open: yes is said to a visitor with a live grant on a link that guards the
/// address, and to nobody else, and holds for this question alone.
///
///     204  X-Velk-Sharing-Hash       the link
///          X-Velk-Sharing-Uid        the account's user id, where the visitor has one
///          X-Velk-Sharing-Remaining  seconds until the grant ends, if it is not used again
///     401  X-Velk-Sharing-Login      path and query of the page where the visitor can get in
///     403  nobody can get in, or not by a page: no link guards the address; it is not clearly an
///          address; the links are no longer valid, or open ones, whose hashes are their secrets
///     503  the database does not answer
class Gatekeeper {
 public:
  /// Everything must outlive this.
  Gatekeeper(const SiteSettings &settings, const Pages &pages, Guards &guards);

  /// @param request one with a question.
  /// @param note filled in.
  Response Answer(const Answers &answers, const Request &request, AccessNote &note) const;

 private:
  Response Ask(const Answers &answers, const gate::Address &address,
               const std::vector<std::string> &hashes) const;
  std::string LoginAddress(const std::string &hash, const gate::Address &address) const;

  const SiteSettings &settings_;
  const Pages &pages_;
  Guards &guards_;
};

}  // namespace web

#endif
