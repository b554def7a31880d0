#ifndef VELKWEBAPI_REQUEST_H
#define VELKWEBAPI_REQUEST_H

#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace webapi {

/// A command line that is no request. The message repeats no value: one may be a secret.
class UsageMistake : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// What the command line asks for, as it stands there.
struct Request {
  std::string api;
  std::string version;  ///< Decimal digits, after a minus perhaps.
  std::string method;
  std::vector<std::pair<std::string, std::string>> parameters;  ///< Names are not empty.
};

/// Reads "--exec", "api=…", "version=…" and "method=…", the last three in any order, and behind
/// them the parameters. A parameter may have any name, also "method".
/// @throws UsageMistake.
Request ParseRequest(const std::vector<std::string> &arguments);

}  // namespace webapi

#endif
