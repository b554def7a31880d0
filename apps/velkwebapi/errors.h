#ifndef VELKWEBAPI_ERRORS_H
#define VELKWEBAPI_ERRORS_H

#include <array>
#include <stdexcept>
#include <string>

#include "operations/failure.h"

namespace webapi {

/// Why a request was not done: the member "code" of an error. Codes keep their meaning for ever.
enum ErrorCode {
  UNKNOWN_API = 101,
  UNKNOWN_VERSION = 102,
  UNKNOWN_METHOD = 103,
  UNKNOWN_PARAMETER = 201,
  DUPLICATE_PARAMETER = 202,
  MISSING_PARAMETER = 203,
  BAD_PARAMETER = 204,
  NOT_FOUND = 301,
  REFUSED = 302,
  DATABASE_UNUSABLE = 401,
  SYSTEM_FAILED = 402
};

/// What a code is called and means.
struct ErrorDescription {
  ErrorCode code;
  const char *name;
  const char *meaning;
};

constexpr std::array<ErrorDescription, 11> kErrors = {{
    {UNKNOWN_API, "UNKNOWN_API", "there is no such API"},
    {UNKNOWN_VERSION, "UNKNOWN_VERSION", "the API has no such version"},
    {UNKNOWN_METHOD, "UNKNOWN_METHOD", "the API has no such method"},
    {UNKNOWN_PARAMETER, "UNKNOWN_PARAMETER", "the method has no such parameter"},
    {DUPLICATE_PARAMETER, "DUPLICATE_PARAMETER", "a parameter is given more than once"},
    {MISSING_PARAMETER, "MISSING_PARAMETER", "a parameter that is needed is not given"},
    {BAD_PARAMETER, "BAD_PARAMETER", "a parameter has a value that it cannot take"},
    {NOT_FOUND, "NOT_FOUND", "a link, session, address, account or group does not exist"},
    {REFUSED, "REFUSED", "a rule of the records forbids it; the message tells which"},
    {DATABASE_UNUSABLE, "DATABASE_UNUSABLE", "the database cannot be used or a statement failed"},
    {SYSTEM_FAILED, "SYSTEM_FAILED", "files, memory or another program failed"},
}};

/// A request that was understood and is not done.
class Refusal : public std::runtime_error {
 public:
  /// @param message one sentence without a full stop, free of secrets.
  Refusal(ErrorCode code, const std::string &message);

  ErrorCode code() const { return code_; }

 private:
  ErrorCode code_;
};

/// The code of an operation's failure.
ErrorCode CodeOf(const operations::Failure &failure);

}  // namespace webapi

#endif
