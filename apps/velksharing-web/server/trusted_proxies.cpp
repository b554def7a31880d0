#include "server/trusted_proxies.h"

#include <strings.h>

#include <algorithm>
#include <string_view>

#include "common/address.h"
#include "common/text.h"

namespace web {
namespace {

/// All fields of a name as one list, in their order.
std::string Joined(const Fields &fields, const char *name) {
  std::string list;
  for (const auto &[field, value] : fields) {
    if (strcasecmp(field.c_str(), name) != 0) continue;
    if (!list.empty()) list += ',';
    list += value;
  }
  return list;
}

/// An address as the C library prints it; "" for anything else.
std::string Canonical(std::string_view text) {
  const auto address = velk::ParseAddress(std::string(velk::Trim(text, " \t")).c_str());
  return address ? velk::PrintAddress(*address) : "";
}

}  // namespace

TrustedProxies::TrustedProxies(std::vector<std::string> peers) : peers_(std::move(peers)) {}

bool TrustedProxies::Identify(const std::string &peer, Request &request) const {
  request.remote_address = peer;
  if (!Trusts(peer)) return !peer.empty();

  request.is_https = request.headers.Get("X-Forwarded-Proto") == "https";
  // Each proxy adds the one that it heard from at the end. What lies before the first that is not
  // trusted is the visitor's own invention.
  std::string chain = Joined(request.headers, "X-Forwarded-For");
  while (!chain.empty()) {
    const size_t comma = chain.rfind(',');
    request.remote_address = Canonical(chain.substr(comma == std::string::npos ? 0 : comma + 1));
    if (comma == std::string::npos || !IsListed(request.remote_address)) break;
    chain.resize(comma);
  }
  return !request.remote_address.empty();
}

bool TrustedProxies::Trusts(const std::string &peer) const {
  return IsListed(peer.empty() ? "unix" : peer);
}

bool TrustedProxies::IsListed(const std::string &name) const {
  return std::find(peers_.begin(), peers_.end(), name) != peers_.end();
}

}  // namespace web
