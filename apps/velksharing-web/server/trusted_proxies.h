#ifndef VELKSHARING_WEB_SERVER_TRUSTED_PROXIES_H
#define VELKSHARING_WEB_SERVER_TRUSTED_PROXIES_H

#include <string>
#include <vector>

#include "http/request.h"

namespace web {

/// Web servers in front of the embedded one, whose word on the visitor's address and scheme
/// (X-Forwarded-For, X-Forwarded-Proto) counts. Nobody else's does.
class TrustedProxies {
 public:
  /// @param peers addresses as the C library prints them; "unix" for whoever uses a socket that has
  ///        a path.
  explicit TrustedProxies(std::vector<std::string> peers);

  /// Sets the visitor's address and scheme of a request that came from `peer`.
  /// @param peer its address; "" for a socket that has a path.
  /// @return false when there is no address to be had: the request cannot be served.
  bool Identify(const std::string &peer, Request &request) const;

  /// Whether the word of `peer` counts; "" for whoever uses a socket that has a path.
  bool Trusts(const std::string &peer) const;

 private:
  bool IsListed(const std::string &name) const;

  std::vector<std::string> peers_;
};

}  // namespace web

#endif
