#ifndef VELKSHARINGURL_SETTINGS_H
#define VELKSHARINGURL_SETTINGS_H

#include <optional>
#include <string>

namespace sharing_url {

/// How the server is reached from outside, as VELK_ROOT/etc/sharing-url.conf says.
struct Settings {
  std::optional<std::string> external_host;  ///< As HostForUrl() gives it.
  std::optional<int> external_port;          ///< 1 to 65535.
  std::optional<bool> https;
  std::optional<std::string> path;  ///< Not empty; as PathForUrl() gives it.
};

/// A missing file leaves everything unset.
/// @throws Mistake naming file, line and key.
Settings ReadSettings();

}  // namespace sharing_url

#endif
