#include "site/cgi_environment.h"

#include <algorithm>
#include <map>

#include "http/wipe.h"

namespace web {
namespace {

/// Fields that CGI hands over in another way, or not at all.
constexpr std::string_view kNotHandedOver[] = {"HTTP_PROXY", "HTTP_AUTHORIZATION",
                                               "HTTP_PROXY_AUTHORIZATION", "HTTP_CONTENT_TYPE",
                                               "HTTP_CONTENT_LENGTH"};

bool IsOneLine(std::string_view value) {
  return value.find_first_of(std::string_view("\0\r\n", 3)) == std::string_view::npos;
}

std::map<std::string, std::string> Variables(const Request &request) {
  std::map<std::string, std::string> variables = {
      {"GATEWAY_INTERFACE", "CGI/1.1"},
      {"REMOTE_ADDR", request.remote_address},
      {"REQUEST_METHOD", request.method},
      {"QUERY_STRING", request.query},
  };
  if (request.is_https) variables["HTTPS"] = "on";
  if (!request.body.empty()) {
    variables["CONTENT_LENGTH"] = std::to_string(request.body.size());
    variables["CONTENT_TYPE"] = request.headers.Get("Content-Type");
  }
  for (const auto &[header, value] : request.headers) {
    const std::string name = CgiName(header);
    if (name.empty()) continue;
    const auto [at, is_new] = variables.try_emplace(name, value);
    if (!is_new) at->second += (name == "HTTP_COOKIE" ? "; " : ", ") + value;
  }
  return variables;
}

}  // namespace

std::string CgiName(std::string_view header) {
  std::string name = "HTTP_";
  for (const char byte : header) {
    if (byte >= 'a' && byte <= 'z') {
      name += static_cast<char>(byte - 'a' + 'A');
    } else if ((byte >= 'A' && byte <= 'Z') || (byte >= '0' && byte <= '9')) {
      name += byte;
    } else if (byte == '-') {
      name += '_';
    } else {
      return "";
    }
  }
  if (header.empty() || std::ranges::find(kNotHandedOver, name) != std::end(kNotHandedOver))
    return "";
  return name;
}

std::vector<std::string> CgiEnvironment(const Request &request) {
  std::vector<std::string> environment;
  for (auto &[name, value] : Variables(request)) {
    if (!IsOneLine(value)) continue;
    environment.push_back(name + "=" + value);
  }
  return environment;
}

PlatformRequest::PlatformRequest(const Request &request) : variables_(CgiEnvironment(request)) {
  for (const std::string &variable : variables_) environment_.push_back(variable.c_str());
  environment_.push_back(nullptr);
  request_ = {environment_.data(), request.body.data(), request.body.size()};
  VelkCgiRequestBegin(&request_);
}

PlatformRequest::~PlatformRequest() {
  VelkCgiRequestEnd();
  for (std::string &variable : variables_) Wipe(variable);
}

}  // namespace web
