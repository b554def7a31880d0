#ifndef VELKWEBAPI_PARAMETERS_H
#define VELKWEBAPI_PARAMETERS_H

#include <json/value.h>

#include <map>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "api.h"
#include "operations/database.h"
#include "operations/secret.h"
#include "request.h"

namespace webapi {

/// The parameters of one request, checked against their method's table and parsed. Values are
/// asked for by the type that the table gives; a parameter that was not given has none.
class Parameters {
 public:
  /// @throws Refusal naming the parameter: unknown, given twice, missing, bad, or an account that
  ///         does not exist. Values are parsed in the table's order, so that descriptors, which
  ///         stand last there, are read when everything else is right.
  Parameters(const Method &method, const Request &request);

  std::optional<std::string> Text(const std::string &name) const;  ///< Choices and addresses, too.
  std::optional<long> Integer(const std::string &name) const;
  std::optional<bool> Boolean(const std::string &name) const;
  std::optional<unsigned int> Account(const std::string &name) const;
  std::optional<Json::Value> Object(const std::string &name) const;
  std::optional<std::vector<std::string>> Texts(const std::string &name) const;

  /// What a descriptor gave; gone from here.
  std::optional<operations::Secret> TakeSecret(const std::string &name);

  /// A text that the table requires.
  std::string RequiredText(const std::string &name) const { return *Text(name); }

 private:
  using Value = std::variant<std::string, long, bool, unsigned int, Json::Value,
                             std::vector<std::string>, operations::Secret>;

  static Value Parse(const Parameter &parameter, const std::string &text);
  template <typename T>
  std::optional<T> Find(const std::string &name) const;

  std::map<std::string, Value> values_;
};

/// "offset" and "limit", and the page that they ask for.
std::vector<Parameter> PageParameters();
operations::Page ToPage(const Parameters &parameters);

}  // namespace webapi

#endif
