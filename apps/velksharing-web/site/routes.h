#ifndef VELKSHARING_WEB_SITE_ROUTES_H
#define VELKSHARING_WEB_SITE_ROUTES_H

#include <string>
#include <string_view>
#include <vector>

namespace web {

/// What an address names.
struct Route {
  enum Kind {
    NOWHERE,
    HEALTH,  ///< BASE-health
    ASSET,   ///< BASE/-/NAME
    LINK     ///< BASE/HASH and all below
  };

  Kind kind = NOWHERE;
  std::string hash;                ///< Of a link: 1 to 64 letters and digits.
  std::vector<std::string> parts;  ///< Below a link; an asset's name.
  bool ends_with_slash = false;

  /// Whether it is the address by which visitors leave a link.
  bool IsLogout() const;
};

/// Whether a text can be the hash of a link: 1 to 64 letters and digits.
bool IsHash(std::string_view text);

/// Reads the path of a request. Whatever is not one of these addresses is NOWHERE.
/// @param base_path as in SiteSettings.
Route FindRoute(std::string_view base_path, std::string_view path);

}  // namespace web

#endif
