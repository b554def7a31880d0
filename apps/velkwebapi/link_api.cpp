#include <climits>

#include "apis.h"
#include "errors.h"
#include "operations/json_form.h"
#include "operations/link_url.h"
#include "operations/links.h"
#include "operations/verdict.h"
#include "parameters.h"
#include "velksharing/constants.h"

namespace webapi {
namespace {

using namespace operations;
using namespace VELK::sharing;

constexpr long kLastMoment = 253402300799;  // 9999-12-31T23:59:59Z

constexpr char kAscending[] = "asc";
constexpr char kDescending[] = "desc";

const Parameter kHash = {SZK_HASH, TEXT, REQUIRED, "The link."};
const Parameter kOwnerFilter = {"owner", ACCOUNT, OPTIONAL, "Only this account's."};
const Parameter kProjectFilter = {"project", TEXT, OPTIONAL, "Only this application's."};

std::vector<Parameter> operator+(std::vector<Parameter> first,
                                 const std::vector<Parameter> &second) {
  first.insert(first.end(), second.begin(), second.end());
  return first;
}

// --- create, set: a link's fields, under the names of its JSON form ---

/// @param presence of what a link cannot be without.
std::vector<Parameter> FieldParameters(Presence presence) {
  return {
      {SZK_PROJECT_NAME, TEXT, presence, "The application that shares; not empty."},
      {"owner", ACCOUNT, presence, "The account on whose behalf is shared."},
      {SZK_ENABLED_, BOOLEAN, OPTIONAL, "Whether the link is switched on."},
      {SZK_START_AT, INTEGER, OPTIONAL,
       "Usable from this moment, in seconds since the Unix epoch; 0: no start.", 0, kLastMoment},
      {SZK_EXPIRE_AT, INTEGER, OPTIONAL,
       "Usable until this moment, in seconds since the Unix epoch; 0: no end.", 0, kLastMoment},
      {SZK_EXPIRE_TIMES, INTEGER, OPTIONAL, "Number of logins allowed; 0: any.", 0, INT_MAX},
      {SZK_AUTO_GC, BOOLEAN, OPTIONAL, "Whether automatic purges may remove it once expired."},
      {SZK_ENABLE_MATCH_IP, BOOLEAN, OPTIONAL,
       "Whether a visitor is held to the address of the login."},
      {SZK_PROTECT_TYPE,
       CHOICE,
       OPTIONAL,
       "The kind of protection; when not given, what else is given tells.",
       0,
       0,
       {SZK_PROTECT_PROTECT_NONE, SZK_PROTECT_PROTECT_PASSWORD, SZK_PROTECT_PROTECT_USER}},
      {SZK_PROTECT_TITLE, TEXT, OPTIONAL, "The title shown with the prompt."},
      {SZK_PROTECT_USERS, TEXTS, OPTIONAL, "The permitted accounts, by name."},
      {SZK_PROTECT_GROUPS, TEXTS, OPTIONAL, "The permitted groups, by name."},
      {"allow_unknown", BOOLEAN, OPTIONAL,
       "Accept names that this machine does not know; they never count."},
      {SZK_REDIRECT_TYPE,
       CHOICE,
       OPTIONAL,
       "Where a visitor is sent.",
       0,
       0,
       {SZK_REDIRECT_REDIRECT_NONE, SZK_REDIRECT_REDIRECT_URLPARAM, SZK_REDIRECT_REDIRECT_ALWAYS}},
      {SZK_REDIRECT_URI, TEXT, OPTIONAL, "The redirect's target."},
      {SZK_APP, OBJECT, OPTIONAL, "The application's data."},
      {SZK_PRIVATE_DATA, OBJECT, OPTIONAL, "The application's data that front ends do not show."},
      {"password_fd", DESCRIPTOR, OPTIONAL, "Open descriptor whose first line is the password.", 0,
       INT_MAX},
  };
}

void ReadProtection(Parameters &parameters, LinkChange &change) {
  change.users = parameters.Texts(SZK_PROTECT_USERS);
  change.groups = parameters.Texts(SZK_PROTECT_GROUPS);
  change.allow_unknown = parameters.Boolean("allow_unknown").value_or(false);
  change.title = parameters.Text(SZK_PROTECT_TITLE);
  change.password = parameters.TakeSecret("password_fd");
  const std::optional<std::string> type = parameters.Text(SZK_PROTECT_TYPE);
  change.open = type == SZK_PROTECT_PROTECT_NONE;
  if (type == SZK_PROTECT_PROTECT_PASSWORD && !change.password) {
    throw Refusal(MISSING_PARAMETER,
                  "parameter “password_fd” is missing, which protect_type=password needs");
  }
  if (type == SZK_PROTECT_PROTECT_USER && !change.users && !change.groups) {
    throw Refusal(MISSING_PARAMETER,
                  "parameter “protect_users” or “protect_groups” is missing, which "
                  "protect_type=user needs");
  }
}

void ReadLimits(const Parameters &parameters, LinkChange &change) {
  change.start_at = parameters.Integer(SZK_START_AT);
  change.expire_at = parameters.Integer(SZK_EXPIRE_AT);
  if (const auto times = parameters.Integer(SZK_EXPIRE_TIMES))
    change.expire_times = static_cast<int>(*times);
  change.match_ip = parameters.Boolean(SZK_ENABLE_MATCH_IP);
  change.auto_remove = parameters.Boolean(SZK_AUTO_GC);
}

LinkChange ToChange(Parameters &parameters) {
  LinkChange change;
  change.project = parameters.Text(SZK_PROJECT_NAME);
  change.owner_uid = parameters.Account("owner");
  change.enabled = parameters.Boolean(SZK_ENABLED_);
  ReadProtection(parameters, change);
  ReadLimits(parameters, change);
  if (const auto type = parameters.Text(SZK_REDIRECT_TYPE))
    change.redirect_type = RedirectTypeFromName(*type);
  change.redirect_uri = parameters.Text(SZK_REDIRECT_URI);
  change.app = parameters.Object(SZK_APP);
  change.private_data = parameters.Object(SZK_PRIVATE_DATA);
  return change;
}

Json::Value Create(Parameters &parameters) {
  const LinkChange change = ToChange(parameters);
  return ToJson(CreateLink(SharingDatabase(), change));
}

Json::Value Set(Parameters &parameters) {
  const LinkChange change = ToChange(parameters);
  return ToJson(ChangeLink(SharingDatabase(), parameters.RequiredText(SZK_HASH), change));
}

// --- list ---

std::vector<std::string> StateNames() {
  std::vector<std::string> names;
  for (const LinkState state : kLinkStates) names.push_back(LinkStateName(state));
  return names;
}

std::vector<std::string> OrderNames() {
  std::vector<std::string> names;
  for (const LinkOrder order : kLinkOrders) names.push_back(LinkOrderColumn(order));
  return names;
}

std::vector<Parameter> ListParameters() {
  return PageParameters() +
         std::vector<Parameter>{
             kProjectFilter,
             kOwnerFilter,
             {"state", CHOICE, OPTIONAL, "Only links in this state.", 0, 0, StateNames()},
             {"sort_by", CHOICE, OPTIONAL, "Order by this field; id when not given.", 0, 0,
              OrderNames()},
             {"sort_direction",
              CHOICE,
              OPTIONAL,
              "Smallest or largest first; asc when not given.",
              0,
              0,
              {kAscending, kDescending}},
         };
}

LinkOrder OrderOf(const std::string &name) {
  for (const LinkOrder order : kLinkOrders)
    if (name == LinkOrderColumn(order)) return order;
  return BY_ID;
}

Json::Value List(Parameters &parameters) {
  LinkQuery query;
  query.project = parameters.Text("project");
  query.owner_uid = parameters.Account("owner");
  if (const auto state = parameters.Text("state")) query.state = LinkStateFromName(*state);
  query.order = OrderOf(parameters.Text("sort_by").value_or(SZK_ID_));
  query.descending = parameters.Text("sort_direction") == kDescending;
  query.page = ToPage(parameters);
  return WithItems(ToJson(ListLinks(SharingDatabase(), query), query.page), "links");
}

// --- the others ---

Json::Value Get(Parameters &parameters) {
  return ToJson(FindLink(SharingDatabase(), parameters.RequiredText(SZK_HASH)));
}

Json::Value Delete(Parameters &parameters) {
  const std::string hash = parameters.RequiredText(SZK_HASH);
  return DeletedLinkToJson(hash, DeleteLink(SharingDatabase(), hash));
}

Json::Value Purge(Parameters &parameters) {
  const std::optional<unsigned int> owner_uid = parameters.Account("owner");
  const std::optional<std::string> project = parameters.Text("project");
  if (!parameters.Boolean("automatic").value_or(false))
    return ToJson(PurgeLinks(SharingDatabase(), owner_uid, project));
  if (owner_uid || project) {
    throw Refusal(BAD_PARAMETER,
                  "parameter “automatic”: an automatic purge is for every owner and project");
  }
  return ToJson(PurgeLinksAutomatically(SharingDatabase()));
}

Json::Value Url(Parameters &parameters) {
  return ToJson(UrlOfLink(SharingDatabase(), parameters.RequiredText(SZK_HASH)));
}

Json::Value Why(Parameters &parameters) {
  const std::string hash = parameters.RequiredText(SZK_HASH);
  const std::string address = parameters.Text(SZK_IP_).value_or("");
  const std::optional<Secret> session = parameters.TakeSecret("session_fd");
  const std::unique_ptr<BaseDB> db = OpenForReading();
  return ToJson(session ? JudgeSession(*db, hash, *session, address)
                        : JudgeLogin(*db, hash, address));
}

}  // namespace

Api LinkApi() {
  const std::vector<Parameter> one_link = {kHash};
  return {"VELK.Sharing.Link",
          1,
          {
              {"list", "Lists links.", ListParameters(), List},
              {"get", "Tells all that is known of a link, but no digest or salt.", one_link, Get},
              {"create", "Makes a link under a fresh hash.", FieldParameters(REQUIRED), Create},
              {"set", "Changes a link; a field that is not given stays as it is.",
               one_link + FieldParameters(OPTIONAL), Set},
              {"delete", "Deletes a link and the grants on it.", one_link, Delete},
              {"purge",
               "Removes the links that are past their expiry or used up.",
               {kOwnerFilter,
                kProjectFilter,
                {"automatic", BOOLEAN, OPTIONAL,
                 "Only links whose auto_gc is true; not together with owner or project."}},
               Purge},
              {"why",
               "Tells whether a visitor would be let in now, and why not; writes nothing.",
               {kHash,
                {SZK_IP_, ADDRESS, OPTIONAL, "The visitor's address."},
                {"session_fd", DESCRIPTOR, OPTIONAL,
                 "Open descriptor whose first line is the identifier of the visitor's session.", 0,
                 INT_MAX}},
               Why},
              {"url", "Tells the URL under which visitors reach a link.", one_link, Url},
          }};
}

}  // namespace webapi
