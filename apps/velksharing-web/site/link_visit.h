#ifndef VELKSHARING_WEB_SITE_LINK_VISIT_H
#define VELKSHARING_WEB_SITE_LINK_VISIT_H

#include <chrono>
#include <optional>
#include <string>

#include "http/form.h"
#include "http/request.h"
#include "http/response.h"
#include "pages/pages.h"
#include "site/answers.h"
#include "site/form_token.h"
#include "site/guards.h"
#include "site/link.h"
#include "site/shared_answers.h"
#include "site/site.h"
#include "site/visitor.h"
#include "site/way_back.h"

namespace web {

/// What every visit uses.
struct SiteParts {
  const SiteSettings &settings;
  const Pages &pages;
  const FormTokens &tokens;
  const Guards &guards;
};

/// One request to one link, which is the platform's current request meanwhile.
///
/// A link that lets nobody in, for whatever reason, answers like one that does not exist: with the
/// same bytes, after the same time.
class LinkVisit {
 public:
  /// Everything must outlive this.
  /// @param note filled in.
  LinkVisit(const SiteParts &site, const Answers &answers, const Request &request,
            const std::string &hash, AccessNote &note);
  LinkVisit(const LinkVisit &) = delete;
  LinkVisit &operator=(const LinkVisit &) = delete;

  /// GET and HEAD: what the link shares for those who are in, and for all others the page by which
  /// they get in.
  Response Look(const SharedRequest &wanted);
  /// POST of the form of that page.
  Response LogIn(const Form &form);
  /// POST of the form by which a visitor leaves.
  Response LogOut(const Form &form);

 private:
  // The link.
  std::optional<Link> FindLink(const std::vector<std::string> &parts = {}) const;
  std::optional<Link> OpenLink(EntryPointer entry, const std::vector<std::string> &parts) const;

  // Ways in, and what is behind.
  Response LookFromOutside(std::optional<Link> link, const SharedRequest &wanted);
  Response EnterByLooking(Link &link, const SharedRequest &wanted);
  Result LogInOneByOne(const Link &link, const Form &form, std::string &session_id);
  /// For somebody who brought his session. What the link guards may not have seen it yet.
  Response ShowAgain(Link &link, const SharedRequest &wanted);
  /// Takes the link's item.
  Response Show(Link &link, const SharedRequest &wanted);
  Response SendOn(const std::string &target);
  Response AskWhetherToLeave(const Link &link) const;
  Response Welcome(const Link &link, const Result &result, const std::string &session_id) const;

  // Pages for those who are outside.
  Response RefusedLogin(const Link &link, const Result &result, const Form &form) const;
  Response AskAgain(const Link &link, const Result &result, const Form &form) const;
  Response Entrance(const Link &link, int status, LoginProblem problem, const Result &result,
                    const std::string &account = "") const;
  std::string EntrancePage(const Link &link, const LoginView &view) const;
  Response Farewell(const Link &link) const;

  // What the visitor is told when there is no link, or none that can be read now.
  Response Absent(const Result &result) const;
  Response Hidden(const Result &result) const;
  Response Unavailable(const Result &result) const;

  const Result &Noted(const Result &result);
  WayBack WayBackFor(const Link &link) const;
  LinkView ViewOf(const Link &link) const;
  Reader FormReader() const;

  const std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
  const SiteParts site_;
  const Answers &answers_;
  const Request &request_;
  const std::string &hash_;
  const std::string address_;
  const Visitor visitor_;
  AccessNote &note_;
};

}  // namespace web

#endif
