#include "parameters.h"

#include <fcntl.h>

#include <algorithm>
#include <charconv>
#include <climits>
#include <set>

#include "errors.h"
#include "operations/accounts.h"
#include "operations/address.h"
#include "operations/json_document.h"
#include "operations/secret_input.h"

namespace webapi {
namespace {

using operations::Failure;
using operations::Secret;

constexpr int kDefaultLimit = 50;
constexpr int kLargestLimit = 1000;

constexpr char kValue[] = "its value";

std::string Quoted(const std::string &name) {
  return "“" + name + "”";
}

bool HasParameter(const Method &method, const std::string &name) {
  return std::any_of(method.parameters.begin(), method.parameters.end(),
                     [&](const Parameter &parameter) { return parameter.name == name; });
}

void CheckNames(const Method &method, const Request &request) {
  std::set<std::string> seen;
  for (const auto &[name, text] : request.parameters) {
    if (!HasParameter(method, name))
      throw Refusal(UNKNOWN_PARAMETER, method.name + " has no parameter " + Quoted(name));
    if (!seen.insert(name).second)
      throw Refusal(DUPLICATE_PARAMETER, "parameter " + Quoted(name) + " is given more than once");
  }
  for (const Parameter &parameter : method.parameters) {
    if (parameter.presence == REQUIRED && !seen.contains(parameter.name))
      throw Refusal(MISSING_PARAMETER, "parameter " + Quoted(parameter.name) + " is missing");
  }
}

long ParseInteger(const Parameter &parameter, const std::string &text) {
  long number = 0;
  const char *end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, number);
  if (error == std::errc() && rest == end && number >= parameter.lowest &&
      number <= parameter.highest)
    return number;
  throw Failure(Failure::INVALID, "it must be a whole number from " +
                                      std::to_string(parameter.lowest) + " to " +
                                      std::to_string(parameter.highest));
}

bool ParseBoolean(const std::string &text) {
  const bool yes = text == "true" || text == "1";
  if (yes || text == "false" || text == "0") return yes;
  throw Failure(Failure::INVALID, "it must be true or false");
}

std::string ParseChoice(const Parameter &parameter, const std::string &text) {
  const auto &choices = parameter.choices;
  if (std::find(choices.begin(), choices.end(), text) != choices.end()) return text;
  std::string list;
  for (const std::string &choice : choices) list += (list.empty() ? "" : ", ") + choice;
  throw Failure(Failure::INVALID, "it must be one of " + list);
}

Secret ReadDescriptor(const Parameter &parameter, const std::string &text) {
  const int descriptor = static_cast<int>(ParseInteger(parameter, text));
  if (fcntl(descriptor, F_GETFD) == -1)
    throw Failure(Failure::INVALID, "there is no open descriptor of this number");
  return operations::ReadSecretLine(descriptor);
}

}  // namespace

Parameters::Parameters(const Method &method, const Request &request) {
  CheckNames(method, request);
  const std::map<std::string, std::string> texts(request.parameters.begin(),
                                                 request.parameters.end());
  for (const Parameter &parameter : method.parameters) {
    const auto text = texts.find(parameter.name);
    if (text == texts.end()) continue;
    try {
      values_.emplace(parameter.name, Parse(parameter, text->second));
    } catch (const Failure &failure) {
      const ErrorCode code = failure.kind() == Failure::NOT_FOUND ? NOT_FOUND : BAD_PARAMETER;
      throw Refusal(code, "parameter " + Quoted(parameter.name) + ": " + failure.what());
    }
  }
}

std::optional<std::string> Parameters::Text(const std::string &name) const {
  return Find<std::string>(name);
}

std::optional<long> Parameters::Integer(const std::string &name) const {
  return Find<long>(name);
}

std::optional<bool> Parameters::Boolean(const std::string &name) const {
  return Find<bool>(name);
}

std::optional<unsigned int> Parameters::Account(const std::string &name) const {
  return Find<unsigned int>(name);
}

std::optional<Json::Value> Parameters::Object(const std::string &name) const {
  return Find<Json::Value>(name);
}

std::optional<std::vector<std::string>> Parameters::Texts(const std::string &name) const {
  return Find<std::vector<std::string>>(name);
}

std::optional<Secret> Parameters::TakeSecret(const std::string &name) {
  const auto value = values_.extract(name);
  if (value.empty()) return std::nullopt;
  return std::get<Secret>(std::move(value.mapped()));
}

Parameters::Value Parameters::Parse(const Parameter &parameter, const std::string &text) {
  switch (parameter.type) {
    case TEXT:
      return text;
    case INTEGER:
      return ParseInteger(parameter, text);
    case BOOLEAN:
      return ParseBoolean(text);
    case CHOICE:
      return ParseChoice(parameter, text);
    case ACCOUNT:
      return operations::ResolveAccount(text);
    case ADDRESS:
      return operations::ParseAddress(text);
    case NETWORK:
      return operations::ParseBlockAddress(text);
    case OBJECT:
      return operations::ParseJsonObject(kValue, text);
    case TEXTS:
      return operations::ParseJsonTexts(kValue, text);
    case DESCRIPTOR:
      return ReadDescriptor(parameter, text);
  }
  return text;
}

template <typename T>
std::optional<T> Parameters::Find(const std::string &name) const {
  const auto value = values_.find(name);
  return value == values_.end() ? std::nullopt : std::optional(std::get<T>(value->second));
}

std::vector<Parameter> PageParameters() {
  return {
      {"offset", INTEGER, OPTIONAL, "Items to skip; 0 when not given.", 0, INT_MAX},
      {"limit", INTEGER, OPTIONAL, "Items to give; 50 when not given.", 1, kLargestLimit},
  };
}

operations::Page ToPage(const Parameters &parameters) {
  return {static_cast<int>(parameters.Integer("offset").value_or(0)),
          static_cast<int>(parameters.Integer("limit").value_or(kDefaultLimit))};
}

}  // namespace webapi
