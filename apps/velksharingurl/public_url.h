#ifndef VELKSHARINGURL_PUBLIC_URL_H
#define VELKSHARINGURL_PUBLIC_URL_H

#include <string>

#include "settings.h"

namespace sharing_url {

/// Where the URL's host comes from.
enum Kind {
  GIVEN_HOST = 1,       ///< From the caller.
  CONFIGURED_HOST = 2,  ///< From the configuration.
  MACHINE_NAME = 3      ///< It is the machine's own name.
};

/// What the caller asks for. Everything but the hash may be left to the configuration.
struct Request {
  std::string hash;
  int port = 0;        ///< 0 to 65535; 0: not given.
  bool https = false;  ///< false: not given.
  std::string host;    ///< As HostForUrl() gives it; "": not given.
  std::string path;    ///< As PathForUrl() gives it; "": not given.
};

struct PublicUrl {
  std::string url;
  Kind kind;
};

/// The link's hash as it stands in a URL.
/// @throws Mistake for one that is empty or that browsers take for a folder: "." and "..".
std::string HashForUrl(const std::string &text);

/// A path as it stands in a URL: percent-encoded, with a slash at its beginning and its end.
/// @param text the path itself, in which nothing is encoded yet.
/// @throws Mistake for one with a part "." or "..", which browsers resolve.
std::string PathForUrl(const std::string &text);

/// The link's URL. The configured host, port and scheme describe the server as it is reached from
/// outside: they count where the caller names no host.
/// @throws Mistake when the machine's name is needed and unfit, and when the URL is longer than a
///         caller reads.
PublicUrl ComposeUrl(const Request &request, const Settings &settings);

}  // namespace sharing_url

#endif
