#include "server/auth_questions.h"

#include <optional>
#include <string_view>

#include "http/host.h"
#include "server/cgi_request.h"

namespace web {
namespace {

/// The value of a field that is there once; nothing else is clear.
std::optional<std::string> OnlyValue(const Fields &fields, const char *name) {
  if (fields.Count(name) != 1) return std::nullopt;
  return *fields.Find(name);
}

/// The value of a variable that is there once.
std::optional<std::string> OnlyValue(const char *const *environment, std::string_view name) {
  std::optional<std::string> value;
  for (; *environment != nullptr; ++environment) {
    std::string_view variable = *environment;
    if (!variable.starts_with(name) || !variable.substr(name.size()).starts_with('=')) continue;
    if (value) return std::nullopt;
    value = variable.substr(name.size() + 1);
  }
  return value;
}

/// Some web servers name a WebSocket's scheme.
std::string PageScheme(const std::string &scheme) {
  if (scheme == "ws") return "http";
  return scheme == "wss" ? "https" : scheme;
}

std::string Joined(const std::optional<std::string> &scheme, const std::optional<std::string> &host,
                   const std::optional<std::string> &target) {
  if (!scheme || !host || !target) return "";
  if (!IsApartFromPath(*host) || !target->starts_with('/')) return "";
  return PageScheme(*scheme) + "://" + *host + *target;
}

std::string ForwardedAddress(const Fields &fields) {
  return Joined(OnlyValue(fields, "X-Forwarded-Proto"), OnlyValue(fields, "X-Forwarded-Host"),
                OnlyValue(fields, "X-Forwarded-Uri"));
}

/// As the web server itself understood the request.
std::string ServedAddress(const char *const *environment) {
  std::optional<std::string> host = OnlyValue(environment, "SERVER_NAME");
  const auto port = OnlyValue(environment, "SERVER_PORT");
  if (!host || !port) return "";
  *host += ":" + *port;
  return Joined(OnlyValue(environment, "REQUEST_SCHEME"), host,
                OnlyValue(environment, "REQUEST_URI"));
}

}  // namespace

AuthQuestions::AuthQuestions(const Settings &settings)
    : source_(settings.auth_address), endpoint_(settings.path + "-auth") {}

void AuthQuestions::Recognise(Request &request, bool is_trusted) const {
  const bool is_question =
      request.path == endpoint_ || (endpoint_ == "-auth" && request.path == "/-auth");
  if (!is_question) return;
  request.question = Question{is_trusted ? AddressFrom(request.headers) : "", false};
}

bool AuthQuestions::Is(const char *const *environment, bool is_authorizer) {
  return is_authorizer || HasVariable(environment, kQuestionParameter);
}

Request AuthQuestions::Read(const char *const *environment, bool is_authorizer) const {
  Request request = ReadCgiHead(environment);
  request.question = Question{AddressFrom(environment, is_authorizer), is_authorizer};
  return request;
}

std::string AuthQuestions::AddressFrom(const Fields &fields) const {
  if (source_ == AuthAddress::X_FORWARDED) return ForwardedAddress(fields);
  if (source_ == AuthAddress::X_ORIGINAL_URL)
    return OnlyValue(fields, "X-Original-URL").value_or("");
  return "";
}

std::string AuthQuestions::AddressFrom(const char *const *environment, bool is_authorizer) const {
  if (is_authorizer) return source_ == AuthAddress::AUTHORIZER ? ServedAddress(environment) : "";
  if (source_ != AuthAddress::PARAMETER) return "";
  return OnlyValue(environment, kQuestionParameter).value_or("");
}

}  // namespace web
