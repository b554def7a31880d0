#ifndef TESTS_INTEGRATION_WEBAPI_SUPPORT_H
#define TESTS_INTEGRATION_WEBAPI_SUPPORT_H

#include <json/writer.h>

#include "integration/cli_support.h"

namespace velk_test {

/// velkwebapi from end to end, each test on a database of its own; the command line makes what a
/// test needs.
class WebApi : public CommandLine {
 protected:
  /// Runs it with these arguments.
  static Outcome RunWebApi(Arguments arguments, const std::string &input = "");

  /// Does one request of version 1, which must be understood.
  /// @return the document that it prints.
  static Json::Value Ask(const std::string &api, const std::string &method,
                         const Arguments &parameters = {}, const std::string &input = "");

  /// The member "data" of a request that must be done.
  static Json::Value Data(const std::string &api, const std::string &method,
                          const Arguments &parameters = {}, const std::string &input = "");

  /// The member "error" of a request that must not be done.
  static Json::Value Error(const std::string &api, const std::string &method,
                           const Arguments &parameters = {}, const std::string &input = "");

  static constexpr char kLink[] = "VELK.Sharing.Link";
  static constexpr char kSession[] = "VELK.Sharing.Session";
  static constexpr char kBlock[] = "VELK.Sharing.Block";
};

/// Matches an error by its code and a part of its message.
MATCHER_P2(IsError, code, part, "") {
  return arg["code"].asInt() == code && arg["message"].asString().find(part) != std::string::npos;
}

}  // namespace velk_test

#endif
