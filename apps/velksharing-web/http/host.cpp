#include "http/host.h"

#include <arpa/inet.h>

#include <algorithm>
#include <string>

#include "http/text.h"

namespace web {
namespace {

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
  if (host.find('\0') != std::string_view::npos) return false;
  in6_addr address;
  return inet_pton(AF_INET6, std::string(host.substr(1, host.size() - 2)).c_str(), &address) == 1;
}

}  // namespace

bool IsHost(std::string_view text) {
  if (IsBracketedIPv6(text)) return true;
  if (!IsHostName(text)) return false;
  return !LooksLikeIPv4(text) || IsIPv4(text);
}

std::optional<int> PortNumber(std::string_view text) {
  if (text.empty() || text.size() > 5 || !std::ranges::all_of(text, IsDigit)) return std::nullopt;
  const int number = std::stoi(std::string(text));
  if (number < 1 || number > 65535) return std::nullopt;
  return number;
}

HostAndPort SplitHostAndPort(std::string_view authority) {
  const size_t bracket = authority.rfind(']');
  const size_t colon = authority.find(':', bracket == std::string_view::npos ? 0 : bracket);
  if (colon == std::string_view::npos) return {authority, std::nullopt};
  return {authority.substr(0, colon), authority.substr(colon + 1)};
}

bool IsApartFromPath(std::string_view authority) {
  return authority.find_first_of("/\\?#") == std::string_view::npos;
}

}  // namespace web
