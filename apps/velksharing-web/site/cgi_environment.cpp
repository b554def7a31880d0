#include "site/cgi_environment.h"

#include <algorithm>
#include <utility>

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

struct Variable {
  std::string name;
  std::string value;
};

/// Makes one variable of those with the same name, in the order in which they came.
std::vector<Variable> United(std::vector<Variable> variables) {
  std::ranges::stable_sort(variables, {}, &Variable::name);
  std::vector<Variable> united;
  for (Variable &variable : variables) {
    if (united.empty() || united.back().name != variable.name) {
      united.push_back(std::move(variable));
    } else {
      const char *const separator = variable.name == "HTTP_COOKIE" ? "; " : ", ";
      united.back().value.append(separator).append(variable.value);
    }
  }
  return united;
}

std::vector<Variable> Variables(const Request &request) {
  std::vector<Variable> variables = {
      {"GATEWAY_INTERFACE", "CGI/1.1"},
      {"REMOTE_ADDR", request.remote_address},
      {"REQUEST_METHOD", request.method},
      {"QUERY_STRING", request.query},
  };
  if (request.is_https) variables.push_back({"HTTPS", "on"});
  if (!request.body.empty()) {
    variables.push_back({"CONTENT_LENGTH", std::to_string(request.body.size())});
    variables.push_back({"CONTENT_TYPE", std::string(request.headers.Get("Content-Type"))});
  }
  for (const auto &[header, value] : request.headers) {
    std::string name = CgiName(header);
    if (!name.empty()) variables.push_back({std::move(name), value});
  }
  return United(std::move(variables));
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
    environment.push_back(std::move(name.append("=").append(value)));
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
