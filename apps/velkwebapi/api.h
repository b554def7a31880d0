#ifndef VELKWEBAPI_API_H
#define VELKWEBAPI_API_H

#include <json/value.h>

#include <string>
#include <vector>

/// The tables that describe the web API. They drive the reading of parameters, the answer of
/// VELK.API.Info, and the check of docs/webapi.md.

namespace webapi {

class Parameters;

/// What the text of a parameter must be.
enum ParameterType {
  TEXT,
  INTEGER,     ///< Decimal, from `lowest` to `highest`.
  BOOLEAN,     ///< "true" or "1", "false" or "0".
  CHOICE,      ///< One of `choices`.
  ACCOUNT,     ///< An account's name, or its number where no account has that name.
  ADDRESS,     ///< An IP address.
  NETWORK,     ///< An IPv4 address, or an IPv6 address or its /64 network.
  OBJECT,      ///< A JSON object.
  TEXTS,       ///< A JSON array of texts.
  DESCRIPTOR,  ///< The number of an open file whose first line is a secret.
};

enum Presence { OPTIONAL, REQUIRED };

struct Parameter {
  std::string name;
  ParameterType type;
  Presence presence;
  std::string description;
  long lowest = 0;
  long highest = 0;
  std::vector<std::string> choices = {};
};

struct Method {
  std::string name;
  std::string description;
  std::vector<Parameter> parameters;

  /// Does it.
  /// @return the member "data" of the answer.
  /// @throws Refusal, operations::Failure.
  Json::Value (*run)(Parameters &parameters);
};

struct Api {
  std::string name;
  int version;
  std::vector<Method> methods;
};

/// "text", "integer", …
const char *TypeName(ParameterType type);

}  // namespace webapi

#endif
