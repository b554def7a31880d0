#include "host.h"

#include <arpa/inet.h>
#include <netdb.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <memory>
#include <string_view>

#include "mistake.h"

namespace sharing_url {
namespace {

constexpr std::size_t kLongestName = 253;
constexpr std::size_t kLongestLabel = 63;

bool IsDigit(char byte) {
  return byte >= '0' && byte <= '9';
}

bool IsLetterOrDigit(char byte) {
  return IsDigit(byte) || (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

void CheckLabel(std::string_view label) {
  if (label.empty()) throw Mistake("has an empty part between its dots");
  if (label.size() > kLongestLabel) throw Mistake("has a part of more than 63 characters");
  const auto is_fit = [](char byte) { return IsLetterOrDigit(byte) || byte == '-'; };
  if (!std::all_of(label.begin(), label.end(), is_fit)) {
    throw Mistake(
        "is no host name: only letters, digits, hyphens and dots may be in it; a name with other "
        "letters is written in its ASCII form, xn--…, and a port stands elsewhere");
  }
  if (label.front() == '-' || label.back() == '-')
    throw Mistake("has a part that begins or ends with a hyphen");
}

/// Programs take a name whose last part is a number for an IPv4 address.
bool LooksLikeIpv4(std::string_view name) {
  const std::string_view last = name.substr(name.rfind('.') + 1);
  return std::all_of(last.begin(), last.end(), IsDigit);
}

void CheckName(std::string_view name) {
  if (name.size() > kLongestName) throw Mistake("has more than 253 characters");
  for (std::size_t begin = 0; begin <= name.size();) {
    const std::size_t end = std::min(name.find('.', begin), name.size());
    CheckLabel(name.substr(begin, end - begin));
    begin = end + 1;
  }
  in_addr address = {};
  if (LooksLikeIpv4(name) && inet_pton(AF_INET, std::string(name).c_str(), &address) != 1)
    throw Mistake("is no IPv4 address, though it ends like one");
}

std::string Ipv6ForUrl(const std::string &text) {
  in6_addr address = {};
  if (inet_pton(AF_INET6, text.c_str(), &address) != 1)
    throw Mistake(
        "is no IPv6 address; a port stands elsewhere, and a zone means nothing to others");
  std::array<char, INET6_ADDRSTRLEN> spelled = {};
  inet_ntop(AF_INET6, &address, spelled.data(), spelled.size());
  return "[" + std::string(spelled.data()) + "]";
}

}  // namespace

std::string HostForUrl(const std::string &text) {
  if (text.starts_with('[') && text.ends_with(']') && text.size() > 1)
    return Ipv6ForUrl(text.substr(1, text.size() - 2));
  if (text.starts_with('[') || text.find(':') != text.rfind(':')) return Ipv6ForUrl(text);
  const std::string name = text.ends_with('.') ? text.substr(0, text.size() - 1) : text;
  CheckName(name);
  return name;
}

std::string MachineName() {
  std::array<char, 256> name = {};
  if (gethostname(name.data(), name.size() - 1) != 0 || name[0] == '\0')
    throw Mistake("is not set");

  addrinfo wanted = {};
  wanted.ai_flags = AI_CANONNAME;
  wanted.ai_socktype = SOCK_STREAM;
  addrinfo *list = nullptr;
  if (getaddrinfo(name.data(), nullptr, &wanted, &list) != 0) return name.data();
  const std::unique_ptr<addrinfo, void (*)(addrinfo *)> found(list, freeaddrinfo);
  const std::string full = found->ai_canonname == nullptr ? "" : found->ai_canonname;
  // Without a dot it is no better; it may be the "localhost" of a hosts file.
  return full.find('.') == std::string::npos ? name.data() : full;
}

}  // namespace sharing_url
