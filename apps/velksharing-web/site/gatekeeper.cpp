#include "site/gatekeeper.h"

#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <algorithm>
#include <ctime>
#include <optional>

#include "gate/local_target.h"
#include "http/percent.h"
#include "http/wipe.h"
#include "site/cgi_environment.h"
#include "site/find_entry.h"
#include "site/link.h"
#include "site/session_ids.h"
#include "site/way_back.h"

namespace web {
namespace {

using VELK::sharing::record::Entry;

constexpr long kUnavailableSeconds = 10;

/// A visitor who is in.
struct Admitted {
  std::string hash;
  Grant grant;
};

/// @param[out] result of the last check; left alone when there was nothing to check.
std::optional<Admitted> FindAdmission(const Request &request,
                                      const std::vector<std::string> &hashes, Result &result) {
  for (const std::string &hash : hashes) {
    for (std::string &session_id : ClaimedGuardSessions(request, hash)) {
      const GrantChecked checked = AuthorizeGrant(hash, session_id);
      Wipe(session_id);
      result = checked.result;
      if (checked.grant) return Admitted{hash, *checked.grant};
    }
  }
  return std::nullopt;
}

Response Opened(const Admitted &admitted, bool is_authorizer) {
  Response response;
  response.status = is_authorizer ? 200 : 204;
  response.headers.Add("X-Velk-Sharing-Hash", admitted.hash);
  const std::string remaining = std::to_string(admitted.grant.remaining);
  response.headers.Add("X-Velk-Sharing-Remaining", remaining);
  const bool has_account = admitted.grant.uid != VELK::sharing::UID_ERR;
  const std::string uid = has_account ? std::to_string(admitted.grant.uid) : "";
  if (has_account) response.headers.Add("X-Velk-Sharing-Uid", uid);
  if (!is_authorizer) return response;
  // What an authorizer gives to the application behind it.
  response.headers.Add("Variable-VELK_SHARING_HASH", admitted.hash);
  response.headers.Add("Variable-VELK_SHARING_UID", uid);
  response.headers.Add("Variable-VELK_SHARING_REMAINING", remaining);
  return response;
}

/// Whether a link's login page may be shown to anybody.
bool HasDoor(const std::string &hash) {
  const EntryPointer link = FindEntry(hash);
  return link != nullptr && link->get_protect_type() != Entry::PROTECT_NONE &&
         AdmitsVisitors(*link);
}

}  // namespace

Gatekeeper::Gatekeeper(const SiteSettings &settings, const Pages &pages, Guards &guards)
    : settings_(settings), pages_(pages), guards_(guards) {}

Response Gatekeeper::Answer(const Answers &answers, const Request &request,
                            AccessNote &note) const {
  note.route = "auth";
  const auto address = gate::Address::Parse(request.question->address);
  if (!settings_.has_gate || !address) return answers.Error(403);
  const PlatformRequest current(request);
  if (!guards_.Refresh()) return answers.Error(503, {}, kUnavailableSeconds);
  const std::vector<std::string> &hashes = guards_.Find(*address);
  Result result;
  const std::optional<Admitted> admitted = FindAdmission(request, hashes, result);
  note.code = result.code;
  note.code_name = result.name;
  if (admitted) {
    note.link = ShortenedHash(admitted->hash);
    return Opened(*admitted, request.question->is_authorizer);
  }
  if (!DatabaseAnswers()) return answers.Error(503, result, kUnavailableSeconds);
  return Ask(answers, *address, hashes);
}

Response Gatekeeper::Ask(const Answers &answers, const gate::Address &address,
                         const std::vector<std::string> &hashes) const {
  const auto door = std::ranges::find_if(hashes, HasDoor);
  if (door == hashes.end()) return answers.Error(403);
  const std::string login = LoginAddress(*door, address);
  Response response = answers.wants_json()
                          ? answers.Error(401)
                          : answers.Page(401, pages_.Guarded({answers.language(), ""}, login));
  response.headers.Add("X-Velk-Sharing-Login", login);
  return response;
}

std::string Gatekeeper::LoginAddress(const std::string &hash, const gate::Address &address) const {
  const std::string login = settings_.base_path + "/" + hash;
  if (!gate::IsLocalTarget(address.target())) return login;
  return login + "?" + kReturnParameter + "=" + PercentEncode(address.target());
}

}  // namespace web
