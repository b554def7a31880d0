#ifndef VELKSHARING_WEB_SITE_CGI_ENVIRONMENT_H
#define VELKSHARING_WEB_SITE_CGI_ENVIRONMENT_H

#include <velk/velkcgi.h>

#include <string>
#include <string_view>
#include <vector>

#include "http/request.h"

namespace web {

/// The name under which CGI hands a header field over: "HTTP_X_VELK_SHARING" for
/// "X-Velk-Sharing".
/// @return "" for a field that is not handed over. A name with other characters than letters,
///         digits and "-" is not: an underscore would pass for a dash. Neither is "Proxy", which
///         as HTTP_PROXY would tell programs where to send their own requests, nor are credentials
///         that are none of the platform's.
std::string CgiName(std::string_view header);

/// A request as CGI defines it: "NAME=value" texts, each name once. Values with a zero byte or a
/// line end are left out, for they could not be handed over whole.
std::vector<std::string> CgiEnvironment(const Request &request);

/// Makes a request the platform's current one until the end of the scope. One at a time in a
/// thread. What it copied of the request is wiped.
class PlatformRequest {
 public:
  explicit PlatformRequest(const Request &request);  ///< `request` must outlive this.
  PlatformRequest(const PlatformRequest &) = delete;
  PlatformRequest &operator=(const PlatformRequest &) = delete;
  ~PlatformRequest();

 private:
  std::vector<std::string> variables_;
  std::vector<const char *> environment_;
  VelkCgiRequest request_;
};

}  // namespace web

#endif
