#include "server/settings.h"

#include <arpa/inet.h>
#include <grp.h>

#include <algorithm>
#include <charconv>

#include "common/address.h"
#include "common/config_file.h"
#include "server/printable.h"
#include "site/routes.h"

namespace web {
namespace {

using velk::ConfigMistake;
using velk::ConfigNumber;

constexpr size_t kLongestSocketPath = 107;
constexpr size_t kLongestProductName = 200;
constexpr std::string_view kAuthAddress = "auth_address";
constexpr std::string_view kProtect = "protect";

bool IsControl(char byte) {
  return static_cast<unsigned char>(byte) < ' ' || byte == '\x7f';
}

std::string AbsolutePath(std::string_view value) {
  if (value.empty() || value.front() != '/') throw ConfigMistake("not an absolute path");
  if (std::any_of(value.begin(), value.end(), IsControl))
    throw ConfigMistake("control characters in a path");
  while (value.size() > 1 && value.back() == '/') value.remove_suffix(1);
  return std::string(value);
}

std::vector<std::string_view> Words(std::string_view value) {
  constexpr std::string_view kBetween = " \t,";
  std::vector<std::string_view> words;
  for (size_t begin = value.find_first_not_of(kBetween); begin != std::string_view::npos;) {
    const size_t end = std::min(value.find_first_of(kBetween, begin), value.size());
    words.push_back(value.substr(begin, end - begin));
    begin = value.find_first_not_of(kBetween, end);
  }
  return words;
}

/// A path of an address: "/a/b", or "" for the root.
std::string UrlPath(std::string_view value) {
  constexpr std::string_view kLetters =
      "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-._~/";
  if (value.empty() || value.front() != '/') throw ConfigMistake("does not begin with a slash");
  if (value.find_first_not_of(kLetters) != std::string_view::npos)
    throw ConfigMistake("other characters than letters, digits and -._~/");
  if (value.back() == '/') value.remove_suffix(1);
  const std::string framed = std::string(value) + "/";
  for (const std::string_view bad : {"//", "/./", "/../"})
    if (framed.find(bad) != std::string::npos)
      throw ConfigMistake("an empty part, \".\" or \"..\" in it");
  return std::string(value);
}

std::string SocketPath(std::string_view value) {
  std::string path = AbsolutePath(value);
  if (path.size() > kLongestSocketPath)
    throw ConfigMistake("longer than " + std::to_string(kLongestSocketPath) + " bytes");
  return path;
}

void SetListen(std::string_view value, Settings &settings) {
  settings.listen = value;
}

bool IsLoopback(const std::string &host) {
  const auto address = velk::ParseAddress(host.c_str());
  if (!address) return false;
  if (address->family == AF_INET6) return IN6_IS_ADDR_LOOPBACK(&address->v6);
  return ntohl(address->v4.s_addr) >> 24 == IN_LOOPBACKNET;
}

/// A socket that only this machine reaches: a path, or ADDRESS:PORT. No name is taken: who knows
/// what it means tomorrow.
std::string LocalSocket(std::string_view value) {
  const size_t colon = value.rfind(':');
  if (value.front() == '/' || colon == std::string_view::npos) return SocketPath(value);
  std::string host(value.substr(0, colon));
  if (host.starts_with('[') && host.ends_with(']')) host = host.substr(1, host.size() - 2);
  if (!IsLoopback(host)) throw ConfigMistake("neither a loopback address nor a path");
  ConfigNumber(value.substr(colon + 1), 0, 65535);
  return std::string(value);
}

void SetFastCgi(std::string_view value, Settings &settings) {
  // Whoever speaks FastCGI says who the visitor is.
  settings.fastcgi = LocalSocket(value);
}

void SetSocketMode(std::string_view value, Settings &settings) {
  const char *end = value.data() + value.size();
  unsigned mode = 0;
  const auto [rest, error] = std::from_chars(value.data(), end, mode, 8);
  if (error != std::errc() || rest != end || mode > 0777)
    throw ConfigMistake("not an octal number from 0 to 777");
  settings.socket_mode = mode;
}

void SetSocketGroup(std::string_view value, Settings &settings) {
  settings.socket_group = value;
  if (getgrnam(settings.socket_group.c_str()) == nullptr) throw ConfigMistake("no such group");
}

void SetWorkers(std::string_view value, Settings &settings) {
  settings.workers = static_cast<int>(ConfigNumber(value, 1, 64));
}

void SetConnections(std::string_view value, Settings &settings) {
  settings.connections = static_cast<int>(ConfigNumber(value, 1, 4096));
}

void SetThreads(std::string_view value, Settings &settings) {
  settings.threads = static_cast<int>(ConfigNumber(value, 1, 256));
}

void SetStopTimeout(std::string_view value, Settings &settings) {
  settings.stop_timeout = static_cast<int>(ConfigNumber(value, 0, 3600));
}

void SetTrustedProxy(std::string_view value, Settings &settings) {
  settings.trusted_proxies.clear();
  for (const std::string_view word : Words(value)) {
    const auto address = velk::ParseAddress(std::string(word).c_str());
    if (!address && word != "unix")
      throw ConfigMistake("neither an address nor unix: " + Printable(word));
    settings.trusted_proxies.push_back(address ? velk::PrintAddress(*address) : "unix");
  }
}

void SetPath(std::string_view value, Settings &settings) {
  settings.path = UrlPath(value);
}

void SetSiteFolder(std::string_view value, Settings &settings) {
  settings.site_folder = AbsolutePath(value);
}

void SetProductName(std::string_view value, Settings &settings) {
  if (value.size() > kLongestProductName)
    throw ConfigMistake("longer than " + std::to_string(kLongestProductName) + " bytes");
  if (std::any_of(value.begin(), value.end(), IsControl))
    throw ConfigMistake("control characters in a name");
  settings.product_name = value;
}

void SetRuntimeFolder(std::string_view value, Settings &settings) {
  settings.runtime_folder = AbsolutePath(value);
}

void SetRetryAfter(std::string_view value, Settings &settings) {
  settings.retry_after = ConfigNumber(value, 1, 86400);
}

void SetAccessLog(std::string_view value, Settings &settings) {
  const bool is_word = value == "off" || value == "stderr" || value == "syslog";
  settings.access_log = is_word ? std::string(value) : AbsolutePath(value);
}

void SetAuthAddress(std::string_view value, Settings &settings) {
  constexpr std::pair<std::string_view, AuthAddress> kWords[] = {
      {"off", AuthAddress::OFF},
      {"parameter", AuthAddress::PARAMETER},
      {"authorizer", AuthAddress::AUTHORIZER},
      {"x-forwarded", AuthAddress::X_FORWARDED},
      {"x-original-url", AuthAddress::X_ORIGINAL_URL},
  };
  const auto *word = std::find_if(std::begin(kWords), std::end(kWords),
                                  [value](const auto &known) { return known.first == value; });
  if (word == std::end(kWords))
    throw ConfigMistake("none of off, parameter, authorizer, x-forwarded, x-original-url");
  settings.auth_address = word->second;
}

void SetProtect(std::string_view value, Settings &settings) {
  const std::vector<std::string_view> words = Words(value);
  if (words.size() != 2) throw ConfigMistake("not a prefix of addresses and the hash of a link");
  auto prefix = gate::Prefix::Parse(words[0]);
  if (!prefix) throw ConfigMistake("no prefix of addresses: " + Printable(words[0]));
  if (!IsHash(words[1])) throw ConfigMistake("no hash of a link: " + Printable(words[1]));
  settings.guarded.push_back({std::move(*prefix), std::string(words[1])});
}

void SetMetricsListen(std::string_view value, Settings &settings) {
  settings.metrics_listen = LocalSocket(value);
}

void SetAudit(std::string_view value, Settings &settings) {
  if (value != "on" && value != "off") throw ConfigMistake("neither on nor off");
  settings.keeps_audit = value == "on";
}

void SetAuditRetention(std::string_view value, Settings &settings) {
  settings.audit_retention = static_cast<int>(ConfigNumber(value, 1, 3650));
}

void SetAuditAddress(std::string_view value, Settings &settings) {
  if (value == "full") {
    settings.audit_address = watch::AddressForm::FULL;
  } else if (value == "network") {
    settings.audit_address = watch::AddressForm::NETWORK;
  } else if (value == "none") {
    settings.audit_address = watch::AddressForm::NONE;
  } else {
    throw ConfigMistake("none of full, network, none");
  }
}

void SetFileDelivery(std::string_view value, Settings &settings) {
  if (value == "copy") {
    settings.file_delivery = FileDelivery::COPY;
  } else if (value == "x-accel-redirect") {
    settings.file_delivery = FileDelivery::X_ACCEL_REDIRECT;
  } else if (value == "x-sendfile") {
    settings.file_delivery = FileDelivery::X_SENDFILE;
  } else {
    throw ConfigMistake("none of copy, x-accel-redirect, x-sendfile");
  }
}

void SetFileFolders(std::string_view value, Settings &settings) {
  settings.file_folders.clear();
  for (const std::string_view word : Words(value))
    settings.file_folders.push_back(AbsolutePath(word));
}

void SetAccelLocation(std::string_view value, Settings &settings) {
  settings.accel_location = UrlPath(value);
}

/// One key and what takes its value.
struct Key {
  std::string_view name;
  void (*set)(std::string_view value, Settings &settings);
};

constexpr Key kKeys[] = {
    {"listen", SetListen},
    {"fastcgi", SetFastCgi},
    {"socket_mode", SetSocketMode},
    {"socket_group", SetSocketGroup},
    {"workers", SetWorkers},
    {"connections", SetConnections},
    {"threads", SetThreads},
    {"stop_timeout", SetStopTimeout},
    {"trusted_proxy", SetTrustedProxy},
    {"path", SetPath},
    {"site_folder", SetSiteFolder},
    {"product_name", SetProductName},
    {"runtime_folder", SetRuntimeFolder},
    {"retry_after", SetRetryAfter},
    {kAuthAddress, SetAuthAddress},
    {kProtect, SetProtect},
    {"access_log", SetAccessLog},
    {"metrics_listen", SetMetricsListen},
    {"audit", SetAudit},
    {"audit_retention", SetAuditRetention},
    {"audit_address", SetAuditAddress},
    {"file_delivery", SetFileDelivery},
    {"file_folders", SetFileFolders},
    {"accel_location", SetAccelLocation},
};

}  // namespace

void Apply(std::string_view key, std::string_view value, Settings &settings) {
  const auto *known = std::find_if(std::begin(kKeys), std::end(kKeys),
                                   [key](const Key &candidate) { return candidate.name == key; });
  if (known == std::end(kKeys)) throw ConfigMistake("unknown key " + Printable(key));
  try {
    if (value.empty()) throw ConfigMistake("no value; leave it out where none is meant");
    known->set(value, settings);
  } catch (const ConfigMistake &mistake) {
    throw ConfigMistake(std::string(key) + ": " + mistake.what());
  }
}

Settings ReadSettings(const std::string &file) {
  Settings settings;
  velk::ReadConfigFile(
      file, [&](std::string_view key, std::string_view value) { Apply(key, value, settings); },
      {kProtect});
  return settings;
}

bool IsAskedByHttp(AuthAddress address) {
  return address == AuthAddress::X_FORWARDED || address == AuthAddress::X_ORIGINAL_URL;
}

std::chrono::hours AuditRetention(const Settings &settings) {
  return std::chrono::hours(24) * settings.audit_retention;
}

void CheckTogether(const Settings &settings) {
  if (!settings.listen.empty() && !settings.fastcgi.empty())
    throw ConfigMistake("listen and fastcgi exclude each other");
  if (settings.file_delivery != FileDelivery::COPY && settings.file_folders.empty())
    throw ConfigMistake("file_delivery by the web server needs file_folders");
  if (IsAskedByHttp(settings.auth_address) && settings.trusted_proxies.empty())
    throw ConfigMistake("auth_address in header fields needs trusted_proxy");
  if (settings.auth_address == AuthAddress::OFF && !settings.guarded.empty())
    throw ConfigMistake("protect needs auth_address");
}

}  // namespace web
