#include "site/redirect_target.h"

#include <arpa/inet.h>

#include <algorithm>
#include <string>

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

bool IsLabel(std::string_view label) {
  return !label.empty() && label.size() <= 63 && label.front() != '-' && label.back() != '-' &&
         std::ranges::all_of(
             label, [](char byte) { return IsLetterOrDigit(byte) || byte == '-' || byte == '_'; });
}

bool IsHostName(std::string_view host) {
  if (host.size() > 253) return false;
  for (;;) {
    const size_t dot = host.find('.');
    if (!IsLabel(host.substr(0, dot))) return false;
    if (dot == std::string_view::npos) break;
    host.remove_prefix(dot + 1);
  }
  return true;
}

/// Browsers read a host whose last label begins with a digit as an IPv4 address in one of many
/// spellings; only the usual one is taken.
bool LooksLikeIPv4(std::string_view host) {
  const size_t dot = host.rfind('.');
  return IsDigit(host[dot == std::string_view::npos ? 0 : dot + 1]);
}

bool IsIPv4(std::string_view host) {
  in_addr address;
  return inet_pton(AF_INET, std::string(host).c_str(), &address) == 1;
}

bool IsBracketedIPv6(std::string_view host) {
  if (host.size() < 2 || host.front() != '[' || host.back() != ']') return false;
  in6_addr address;
  return inet_pton(AF_INET6, std::string(host.substr(1, host.size() - 2)).c_str(), &address) == 1;
}

bool IsHost(std::string_view host) {
  if (IsBracketedIPv6(host)) return true;
  if (!IsHostName(host)) return false;
  return !LooksLikeIPv4(host) || IsIPv4(host);
}

bool IsPort(std::string_view port) {
  if (port.empty() || port.size() > 5 || !std::ranges::all_of(port, IsDigit)) return false;
  const int number = std::stoi(std::string(port));
  return number >= 1 && number <= 65535;
}

bool IsAuthority(std::string_view authority) {
  const size_t bracket = authority.rfind(']');
  const size_t colon = authority.find(':', bracket == std::string_view::npos ? 0 : bracket);
  if (colon == std::string_view::npos) return IsHost(authority);
  return IsHost(authority.substr(0, colon)) && IsPort(authority.substr(colon + 1));
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
