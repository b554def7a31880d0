#ifndef VELKSHARING_WEB_SITE_WAY_BACK_H
#define VELKSHARING_WEB_SITE_WAY_BACK_H

#include <string>
#include <vector>

#include "gate/prefix.h"
#include "http/form.h"
#include "http/request.h"

namespace web {

/// Query parameter of a login page: path and query of the guarded page that the visitor wanted.
extern const char *const kReturnParameter;

/// How a visitor of one link gets from its login page to what the link guards on the same site.
class WayBack {
 public:
  /// @param prefixes all that the link guards.
  /// @param query of the login page; what else it asks for plays no part.
  WayBack(const Request &request, const Form &query, std::vector<gate::Prefix> prefixes);

  /// Path and query of the guarded page that the visitor came from: on this site, below one of the
  /// prefixes. "" for none, and for whatever else was named.
  const std::string &wanted() const { return wanted_; }

  /// Where to go when nothing was wanted: the first prefix on this site, or the first anywhere, as
  /// a whole address. "" when the link guards nothing.
  std::string Default() const;

  /// Path of a cookie that is sent to all that the link guards on this site; "" when that is
  /// nothing.
  std::string CookiePath() const;

 private:
  std::vector<gate::Prefix> everywhere_;
  std::vector<gate::Prefix> here_;  ///< On this site.
  std::string wanted_;
};

}  // namespace web

#endif
