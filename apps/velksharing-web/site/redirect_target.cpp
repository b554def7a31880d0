#include "site/redirect_target.h"

#include <algorithm>

#include "http/host.h"
#include "http/text.h"

namespace web {
namespace {

constexpr size_t kLongest = 2048;

/// Takes `prefix` away from the front of `text`, whatever its case.
bool TakePrefix(std::string_view &text, std::string_view prefix) {
  if (!IsSameText(text.substr(0, prefix.size()), prefix)) return false;
  text.remove_prefix(prefix.size());
  return true;
}

bool IsAuthority(std::string_view authority) {
  const HostAndPort parts = SplitHostAndPort(authority);
  return IsHost(parts.host) && (!parts.port || PortNumber(*parts.port));
}

/// Path, query and fragment: the characters of RFC 3986, and escapes that are whole.
bool IsRest(std::string_view rest) {
  constexpr std::string_view kMarks = "-._~!$&'()*+,;=:@/?#[]";
  for (size_t at = 0; at < rest.size(); ++at) {
    if (rest[at] == '%') {
      if (rest.size() - at < 3 || HexDigitValue(rest[at + 1]) < 0 ||
          HexDigitValue(rest[at + 2]) < 0)
        return false;
    } else if (!IsLetterOrDigit(rest[at]) && kMarks.find(rest[at]) == std::string_view::npos) {
      return false;
    }
  }
  return true;
}

}  // namespace

bool IsWebAddress(std::string_view text) {
  if (text.size() > kLongest) return false;
  if (!TakePrefix(text, "https://") && !TakePrefix(text, "http://")) return false;
  const size_t end = std::min(text.find_first_of("/?#"), text.size());
  return end > 0 && IsAuthority(text.substr(0, end)) && IsRest(text.substr(end));
}

}  // namespace web
