#include "site/way_back.h"

#include <algorithm>
#include <iterator>
#include <optional>
#include <utility>

#include "gate/address.h"
#include "gate/local_target.h"
#include "http/host.h"

namespace web {
namespace {

/// The address of something on the site that a request came to; nothing when it does not tell
/// clearly which that is.
std::optional<gate::Address> OnThisSite(const Request &request, const std::string &target) {
  const std::string *host = request.headers.Find("Host");
  if (host == nullptr || request.headers.Count("Host") > 1) return std::nullopt;
  if (!IsApartFromPath(*host)) return std::nullopt;
  return gate::Address::Parse((request.is_https ? "https://" : "http://") + *host + target);
}

std::vector<gate::Prefix> Here(const Request &request,
                               const std::vector<gate::Prefix> &everywhere) {
  std::vector<gate::Prefix> here;
  if (everywhere.empty()) return here;
  const std::optional<gate::Address> site = OnThisSite(request, "/");
  std::ranges::copy_if(everywhere, std::back_inserter(here), [&](const gate::Prefix &prefix) {
    return prefix.origin().empty() || (site && prefix.origin() == site->origin());
  });
  return here;
}

/// The target when one of the prefixes covers it, else "".
std::string Covered(const Request &request, const std::string *target,
                    const std::vector<gate::Prefix> &here) {
  if (target == nullptr || !gate::IsLocalTarget(*target)) return "";
  const std::optional<gate::Address> address = OnThisSite(request, *target);
  if (!address) return "";
  const bool is_covered = std::ranges::any_of(
      here, [&](const gate::Prefix &prefix) { return prefix.Covers(*address); });
  return is_covered ? *target : "";
}

std::string WithSlash(std::string address) {
  if (!address.ends_with('/')) address += '/';
  return address;
}

}  // namespace

const char *const kReturnParameter = "return";

WayBack::WayBack(const Request &request, const Form &query, std::vector<gate::Prefix> prefixes)
    : everywhere_(std::move(prefixes)),
      here_(Here(request, everywhere_)),
      wanted_(Covered(request, query.Find(kReturnParameter), here_)) {}

std::string WayBack::Default() const {
  if (!here_.empty()) return WithSlash(here_.front().CookiePath());
  return everywhere_.empty() ? "" : WithSlash(everywhere_.front().text());
}

std::string WayBack::CookiePath() const {
  return here_.empty() ? "" : gate::CommonCookiePath(here_);
}

}  // namespace web
