#include "site/session_ids.h"

#include <velksharing/constants.h>

#include <algorithm>

#include "http/cookies.h"
#include "http/text.h"
#include "site/cgi_environment.h"

namespace web {
namespace {

constexpr size_t kLongestSessionId = 128;
constexpr size_t kMostClaims = 4;

bool IsSessionIdByte(char byte) {
  return IsLetterOrDigit(byte) || byte == '-' || byte == '_';
}

}  // namespace

bool IsSessionId(std::string_view text) {
  return !text.empty() && text.size() <= kLongestSessionId &&
         std::ranges::all_of(text, IsSessionIdByte);
}

const std::string *FindSessionField(const Request &request) {
  for (const auto &[name, value] : request.headers)
    if (CgiName(name) == SZ_X_SHARING_HEADER) return &value;
  return nullptr;
}

std::string GuardCookieName(const std::string &hash) {
  return std::string(VELK::sharing::SZK_SHARING_SID) + "_" + hash;
}

std::vector<std::string> ClaimedGuardSessions(const Request &request, const std::string &hash) {
  std::vector<std::string> claims;
  const std::string *field = FindSessionField(request);
  if (field != nullptr && !field->empty()) {
    if (IsSessionId(*field)) claims.push_back(*field);
    return claims;
  }
  for (const std::string_view value : FindCookies(request, GuardCookieName(hash)))
    if (IsSessionId(value) && claims.size() < kMostClaims) claims.emplace_back(value);
  return claims;
}

}  // namespace web
