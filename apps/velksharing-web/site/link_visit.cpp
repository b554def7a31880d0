#include "site/link_visit.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <optional>
#include <thread>
#include <utility>

#include "site/access.h"
#include "site/event_note.h"
#include "site/result_names.h"
#include "site/use_lock.h"

namespace web {
namespace {

using std::chrono::milliseconds;
using VELK::sharing::record::Entry;

/// How long a link that lets nobody in takes to say so. More than any of the reasons needs, so
/// that nobody tells them apart by a clock.
constexpr milliseconds kHiddenTime(2);
constexpr milliseconds kLockPatience(15000);
constexpr long kUnavailableSeconds = 10;

/// A query that says that the visitor has just left.
constexpr char kFarewellParameter[] = "logged-out";

/// Whether a check may have failed because the session's account is gone.
bool MayLackItsAccount(const Link &link) {
  return link.entry->get_protect_type() == Entry::PROTECT_USER && DatabaseAnswers();
}

Result LoginResult(int code) {
  return {code, LoginResultName(code)};
}

/// Where a visitor goes on to as soon as he is in; "" when he stays.
std::string DestinationOf(const Link &link, const WayBack &way_back) {
  if (!way_back.wanted().empty()) return way_back.wanted();
  if (!link.target.empty() || link.tree) return link.target;
  return way_back.Default();
}

}  // namespace

LinkVisit::LinkVisit(const SiteParts &site, const Answers &answers, const Request &request,
                     const std::string &hash, AccessNote &note)
    : site_(site),
      answers_(answers),
      request_(request),
      hash_(hash),
      address_(site.settings.base_path + "/" + hash),
      visitor_(request, site.tokens, hash_, address_),
      note_(note) {}

Response LinkVisit::Look(const SharedRequest &wanted) {
  note_.route = "page";
  if (visitor_.session_id().empty()) return LookFromOutside(FindLink(wanted.parts), wanted);
  Checked checked = Authorize(hash_, visitor_.session_id());
  const Result &result = Noted(checked.result);
  std::optional<Link> link;
  if (checked.link) link = OpenLink(std::move(checked.link), wanted.parts);
  if (result.code == VELK_SHARING_AUTH_OK)
    return link ? ShowAgain(*link, wanted) : Hidden(CheckResult(VELK_SHARING_AUTH_NO_GRANT));
  if (result.code == VELK_SHARING_AUTH_UNUSABLE && !(link && MayLackItsAccount(*link)))
    return Unavailable(result);
  return LookFromOutside(std::move(link), wanted);
}

Response LinkVisit::LogIn(const Form &form) {
  note_.route = "login";
  const std::optional<Link> link = FindLink();
  if (!link || !AdmitsVisitors(*link->entry))
    return Absent(LoginResult(VELK_SHARING_LOGIN_REFUSED));
  if (!visitor_.HasRightForm(form))
    return Entrance(*link, 403, LoginProblem::kFormExpired, Result{});
  Secret session_id;
  const Result result = Noted(LogInOneByOne(*link, form, session_id.text()));
  NoteLogin(*link, session_id.text(), note_);
  if (result.code != VELK_SHARING_LOGIN_OK) return RefusedLogin(*link, result, form);
  return Welcome(*link, result, session_id.text());
}

Response LinkVisit::LogOut(const Form &form) {
  note_.route = "logout";
  if (!visitor_.HasRightForm(form)) return answers_.Error(403);
  const Result result = Noted(web::LogOut(hash_, visitor_.session_id()));
  NoteLogout(hash_, visitor_.session_id(), note_);
  Response response = answers_.wants_json()
                          ? answers_.Json(result.code == 1 ? 200 : 401, result)
                          : answers_.SeeOther(address_ + "?" + kFarewellParameter);
  visitor_.ForgetSession(response);
  if (const std::optional<Link> link = FindLink())
    visitor_.ForgetGuardSession(response, WayBackFor(*link).CookiePath());
  return response;
}

std::optional<Link> LinkVisit::FindLink(const std::vector<std::string> &parts) const {
  EntryPointer entry = FindEntry(hash_);
  if (entry == nullptr) return std::nullopt;
  return OpenLink(std::move(entry), parts);
}

std::optional<Link> LinkVisit::OpenLink(EntryPointer entry,
                                        const std::vector<std::string> &parts) const {
  std::vector<gate::Prefix> prefixes;
  if (site_.settings.has_gate) prefixes = site_.guards.PrefixesOf(*entry);
  return web::OpenLink(std::move(entry), parts, std::move(prefixes));
}

Response LinkVisit::LookFromOutside(std::optional<Link> link, const SharedRequest &wanted) {
  if (!link || !AdmitsVisitors(*link->entry))
    return Absent(CheckResult(VELK_SHARING_AUTH_NO_GRANT));
  if (wanted.query.Has(kFarewellParameter) && !answers_.wants_json()) return Farewell(*link);
  if (link->IsOpen() && !link->HasUseLimit() && !visitor_.OnlyPeeks())
    return EnterByLooking(*link, wanted);
  return Entrance(*link, answers_.wants_json() ? 401 : 200, LoginProblem::kNone,
                  CheckResult(VELK_SHARING_AUTH_NO_SESSION));
}

Response LinkVisit::EnterByLooking(Link &link, const SharedRequest &wanted) {
  const Form nothing;
  Secret session_id;
  const Result result = Noted(LogInOneByOne(link, nothing, session_id.text()));
  NoteLogin(link, session_id.text(), note_);
  if (result.code != VELK_SHARING_LOGIN_OK) return RefusedLogin(link, result, nothing);
  Response response = Show(link, wanted);
  visitor_.KeepSession(response, session_id.text());
  visitor_.KeepGuardSession(response, session_id.text(), WayBackFor(link).CookiePath());
  return response;
}

Result LinkVisit::LogInOneByOne(const Link &link, const Form &form, std::string &session_id) {
  if (!link.HasUseLimit()) return web::LogIn(hash_, form, link.IsOpen(), session_id);
  const UseLock lock(site_.settings.runtime_folder, link.entry->get_id(), kLockPatience);
  if (!lock.IsHeld()) return LoginResult(VELK_SHARING_LOGIN_UNUSABLE);
  return web::LogIn(hash_, form, link.IsOpen(), session_id);
}

Response LinkVisit::ShowAgain(Link &link, const SharedRequest &wanted) {
  Response response = Show(link, wanted);
  if (response.status == 303)
    visitor_.KeepGuardSession(response, visitor_.session_id(), WayBackFor(link).CookiePath());
  return response;
}

Response LinkVisit::Show(Link &link, const SharedRequest &wanted) {
  // What is shared has a button to leave on each page, and may have a file of this name.
  const bool has_own_pages = link.tree.has_value();
  if (wanted.is_logout && !has_own_pages && !link.IsOpen() && !answers_.wants_json())
    return AskWhetherToLeave(link);
  const std::string target = DestinationOf(link, WayBackFor(link));
  if (!target.empty()) return SendOn(target);
  // A token costs more than a small file.
  const Reader reader = wanted.AsksForBytes() ? Reader{answers_.language(), ""} : FormReader();
  const SharedView view = {ViewOf(link), reader, address_, link.CanDownload()};
  Response response = SharedAnswers(answers_, site_.pages, view, *link.tree)
                          .Answer(wanted, std::move(link.item), note_);
  if (response.headers.Get("Content-Type") == Pages::kContentType) visitor_.KeepFormKey(response);
  return response;
}

Response LinkVisit::SendOn(const std::string &target) {
  note_.route = "redirect";
  if (!answers_.wants_json()) return answers_.SeeOther(target);
  Json::Value document = JsonOf(CheckResult(VELK_SHARING_AUTH_OK));
  document["redirect"] = target;
  return answers_.Json(200, document);
}

Response LinkVisit::AskWhetherToLeave(const Link &link) const {
  Response response = answers_.Page(200, site_.pages.Leave(FormReader(), ViewOf(link)));
  visitor_.KeepFormKey(response);
  return response;
}

Response LinkVisit::Welcome(const Link &link, const Result &result,
                            const std::string &session_id) const {
  const WayBack way_back = WayBackFor(link);
  const std::string target = DestinationOf(link, way_back);
  Response response;
  if (answers_.wants_json()) {
    response = answers_.Json(200, result);
  } else if (target.empty() || target.front() == '/') {
    response = answers_.SeeOther(target.empty() ? address_ : target);
  } else {
    // Browsers let a form lead to our own site only, and redirects behind it, too.
    response = answers_.Page(200, site_.pages.Continue(FormReader(), ViewOf(link), target));
  }
  visitor_.KeepSession(response, session_id);
  visitor_.KeepGuardSession(response, session_id, way_back.CookiePath());
  return response;
}

Response LinkVisit::RefusedLogin(const Link &link, const Result &result, const Form &form) const {
  switch (result.code) {
    case VELK_SHARING_LOGIN_ACCOUNT_REFUSED:
    case VELK_SHARING_LOGIN_WRONG_PASSWORD:
    case VELK_SHARING_LOGIN_NOT_PERMITTED:
      return AskAgain(link, result, form);
    case VELK_SHARING_LOGIN_REFUSED: {
      // Nothing was typed; or the link was switched off at this moment.
      const std::optional<Link> now = FindLink();
      return now && AdmitsVisitors(*now->entry) ? AskAgain(*now, result, form) : Absent(result);
    }
    case VELK_SHARING_LOGIN_USED_UP:
      return Absent(LoginResult(VELK_SHARING_LOGIN_REFUSED));
    case VELK_SHARING_LOGIN_BLOCKED:
      return answers_.Error(429, result, site_.settings.retry_after);
    default:
      return Unavailable(result);
  }
}

Response LinkVisit::AskAgain(const Link &link, const Result &result, const Form &form) const {
  const std::string *account = form.Find(VELK::sharing::SZK_ZED_USERNAME);
  return Entrance(link, 401, LoginProblem::kRefused, result, account == nullptr ? "" : *account);
}

Response LinkVisit::Entrance(const Link &link, int status, LoginProblem problem,
                             const Result &result, const std::string &account) const {
  if (answers_.wants_json()) return answers_.Error(status, result);
  const LoginView view = {ViewOf(link), problem, account, WayBackFor(link).wanted()};
  Response response = answers_.Page(status, EntrancePage(link, view));
  visitor_.KeepFormKey(response);
  return response;
}

std::string LinkVisit::EntrancePage(const Link &link, const LoginView &view) const {
  switch (link.entry->get_protect_type()) {
    case Entry::PROTECT_PASSWORD:
      return site_.pages.Password(FormReader(), view);
    case Entry::PROTECT_USER:
      return site_.pages.Account(FormReader(), view);
    case Entry::PROTECT_NONE:
      break;
  }
  return site_.pages.Open(FormReader(), view);
}

Response LinkVisit::Farewell(const Link &link) const {
  LinkView view = ViewOf(link);
  view.can_log_out = false;
  return answers_.Page(200, site_.pages.LoggedOut({answers_.language(), ""}, view));
}

Response LinkVisit::Absent(const Result &result) const {
  return DatabaseAnswers() ? Hidden(result) : Unavailable(result);
}

Response LinkVisit::Hidden(const Result &result) const {
  std::this_thread::sleep_until(start_ + kHiddenTime);
  return answers_.Error(404, result);
}

Response LinkVisit::Unavailable(const Result &result) const {
  return answers_.Error(503, result, kUnavailableSeconds);
}

const Result &LinkVisit::Noted(const Result &result) {
  note_.code = result.code;
  note_.code_name = result.name;
  return result;
}

WayBack LinkVisit::WayBackFor(const Link &link) const {
  return {request_, Form::Parse(request_.query).value_or(Form()), link.prefixes};
}

LinkView LinkVisit::ViewOf(const Link &link) const {
  LinkView view;
  view.hash = hash_;
  view.title = link.entry->get_protect_title();
  view.can_log_out = !link.IsOpen();
  view.continue_to = link.continue_to;
  return view;
}

Reader LinkVisit::FormReader() const {
  return {answers_.language(), visitor_.FormToken()};
}

}  // namespace web
