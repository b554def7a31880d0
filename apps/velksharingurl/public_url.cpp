#include "public_url.h"

#include <string_view>

#include "host.h"
#include "mistake.h"
#include "velk_paths.h"

namespace sharing_url {
namespace {

constexpr char kDefaultPath[] = "/sharing/";

/// The library reads the line into 4096 bytes, which also hold its newline and a zero.
constexpr std::size_t kLongestUrl = 4094;

constexpr std::string_view kUnreserved =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._~";

/// What stands before the path.
struct Origin {
  Kind kind;
  std::string host;
  int port;
  bool https;
};

/// @param kept bytes that stay as they are beside the unreserved ones.
std::string PercentEncoded(std::string_view text, std::string_view kept) {
  static constexpr char kDigits[] = "0123456789ABCDEF";
  std::string encoded;
  for (const char byte : text) {
    const unsigned value = static_cast<unsigned char>(byte);
    if (kUnreserved.find(byte) != std::string_view::npos ||
        kept.find(byte) != std::string_view::npos) {
      encoded += byte;
    } else {
      encoded += '%';
      encoded += kDigits[value / 16];
      encoded += kDigits[value % 16];
    }
  }
  return encoded;
}

bool IsDots(std::string_view part) {
  return part == "." || part == "..";
}

void RefuseDots(std::string_view path) {
  for (std::size_t begin = 0; begin <= path.size();) {
    const std::size_t end = std::min(path.find('/', begin), path.size());
    if (IsDots(path.substr(begin, end - begin)))
      throw Mistake("holds a part “.” or “..”, which browsers resolve");
    begin = end + 1;
  }
}

std::string OwnHost() {
  try {
    return HostForUrl(MachineName());
  } catch (const Mistake &mistake) {
    throw Mistake("the machine's own name " + std::string(mistake.what()) +
                  "; set external_host in " VELK_ROOT "/etc/sharing-url.conf");
  }
}

Origin OriginOf(const Request &request, const Settings &settings) {
  if (!request.host.empty()) return {GIVEN_HOST, request.host, request.port, request.https};
  const int port = request.port != 0 ? request.port : settings.external_port.value_or(0);
  const bool https = request.https || settings.https.value_or(false);
  if (settings.external_host) return {CONFIGURED_HOST, *settings.external_host, port, https};
  return {MACHINE_NAME, OwnHost(), port, https};
}

std::string OriginText(const Origin &origin) {
  const int default_port = origin.https ? 443 : 80;
  const std::string text = (origin.https ? "https://" : "http://") + origin.host;
  if (origin.port == 0 || origin.port == default_port) return text;
  return text + ":" + std::to_string(origin.port);
}

}  // namespace

std::string HashForUrl(const std::string &text) {
  if (text.empty()) throw Mistake("is empty");
  if (IsDots(text)) throw Mistake("is a folder to browsers");
  return PercentEncoded(text, "");
}

std::string PathForUrl(const std::string &text) {
  RefuseDots(text);
  std::string path = PercentEncoded(text, "/");
  if (!path.starts_with('/')) path.insert(0, 1, '/');
  if (!path.ends_with('/')) path += '/';
  return path;
}

PublicUrl ComposeUrl(const Request &request, const Settings &settings) {
  const Origin origin = OriginOf(request, settings);
  const std::string path =
      request.path.empty() ? settings.path.value_or(kDefaultPath) : request.path;
  const std::string url = OriginText(origin) + path + request.hash;
  if (url.size() > kLongestUrl) {
    throw Mistake("the URL would have " + std::to_string(url.size()) + " bytes; at most " +
                  std::to_string(kLongestUrl) + " are read");
  }
  return {url, origin.kind};
}

}  // namespace sharing_url
