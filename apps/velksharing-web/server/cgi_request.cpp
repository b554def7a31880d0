#include "server/cgi_request.h"

#include <algorithm>
#include <charconv>
#include <cstring>
#include <optional>
#include <string_view>

#include "http/percent.h"
#include "http/wipe.h"
#include "server/limits.h"
#include "server/target.h"

namespace web {
namespace {

constexpr int kBadRequest = 400;
constexpr int kContentTooLarge = 413;
constexpr int kHeadTooLarge = 431;

std::optional<std::string_view> FindVariable(const char *const *environment,
                                             std::string_view name) {
  for (; *environment != nullptr; ++environment) {
    const std::string_view variable = *environment;
    if (variable.starts_with(name) && variable.substr(name.size()).starts_with('='))
      return variable.substr(name.size() + 1);
  }
  return std::nullopt;
}

std::string_view Variable(const char *const *environment, std::string_view name) {
  return FindVariable(environment, name).value_or(std::string_view());
}

/// "X_SHARING" becomes "X-Sharing".
std::string FieldName(std::string_view name) {
  std::string field;
  for (const char letter : name) {
    const bool begins_word = field.empty() || field.back() == '-';
    const auto byte = static_cast<unsigned char>(letter);
    if (letter == '_') {
      field += '-';
    } else {
      field += static_cast<char>(begins_word ? toupper(byte) : tolower(byte));
    }
  }
  return field;
}

/// HTTP_PROXY would be read by programs as their own proxy; the others have variables of their own.
bool IsLeftOut(std::string_view name) {
  return name == "PROXY" || name == "CONTENT_TYPE" || name == "CONTENT_LENGTH";
}

Fields ReadFields(const char *const *environment) {
  constexpr std::string_view kPrefix = "HTTP_";
  Fields fields;
  for (auto *place = environment; *place != nullptr; ++place) {
    const std::string_view variable = *place;
    const size_t sign = variable.find('=');
    if (sign == std::string_view::npos || !variable.starts_with(kPrefix)) continue;
    const std::string_view name = variable.substr(kPrefix.size(), sign - kPrefix.size());
    if (!IsLeftOut(name)) fields.Add(FieldName(name), std::string(variable.substr(sign + 1)));
  }
  const std::string_view type = Variable(environment, "CONTENT_TYPE");
  if (!type.empty()) fields.Add("Content-Type", std::string(type));
  return fields;
}

/// A decoded path, encoded again; the slashes stay.
std::string Encoded(std::string_view path) {
  std::string encoded;
  while (!path.empty()) {
    const size_t slash = path.find('/');
    encoded += PercentEncode(path.substr(0, slash));
    if (slash == std::string_view::npos) break;
    encoded += '/';
    path.remove_prefix(slash + 1);
  }
  return encoded;
}

bool ReadTarget(const char *const *environment, Request &request) {
  const std::string_view uri = Variable(environment, "REQUEST_URI");
  if (!uri.empty()) return SetTarget(uri, request);
  request.path =
      Encoded(Variable(environment, "SCRIPT_NAME")) + Encoded(Variable(environment, "PATH_INFO"));
  request.query = Variable(environment, "QUERY_STRING");
  return request.path.starts_with('/');
}

size_t HeadSize(const Request &request) {
  size_t size = request.method.size() + request.path.size() + request.query.size();
  for (const auto &[name, value] : request.headers) size += name.size() + value.size();
  return size;
}

bool ReadWhole(const BodyReader &read, std::string &body) {
  for (size_t done = 0; done < body.size();) {
    const ssize_t got = read(body.data() + done, body.size() - done);
    if (got <= 0) return false;
    done += static_cast<size_t>(got);
  }
  return true;
}

void Discard(uint64_t length, const BodyReader &read) {
  std::string piece(kPiece, '\0');
  for (uint64_t left = std::min<uint64_t>(length, kDiscardLimit); left > 0;) {
    const ssize_t got = read(piece.data(), std::min<uint64_t>(left, piece.size()));
    if (got <= 0) return;
    left -= static_cast<uint64_t>(got);
  }
}

/// @return status to refuse the request with, 0 for none.
int ReadBody(std::string_view length_text, const BodyReader &read, std::string &body) {
  if (length_text.empty()) return 0;
  uint64_t length = 0;
  const char *end = length_text.data() + length_text.size();
  const auto [rest, error] = std::from_chars(length_text.data(), end, length);
  if (error != std::errc() || rest != end) return kBadRequest;
  if (length > kFormLimit) {
    Discard(length, read);
    return kContentTooLarge;
  }
  body.resize(length);
  if (ReadWhole(read, body)) return 0;
  Wipe(body);
  return kBadRequest;
}

}  // namespace

bool HasVariable(const char *const *environment, std::string_view name) {
  return FindVariable(environment, name).has_value();
}

Request ReadCgiHead(const char *const *environment) {
  Request request;
  request.method = Variable(environment, "REQUEST_METHOD");
  request.headers = ReadFields(environment);
  request.remote_address = Variable(environment, "REMOTE_ADDR");
  const std::string_view https = Variable(environment, "HTTPS");
  request.is_https = !https.empty() && https != "off";
  return request;
}

CgiRequest ReadCgiRequest(const char *const *environment, const BodyReader &body) {
  CgiRequest cgi;
  Request &request = cgi.request;
  request = ReadCgiHead(environment);
  if (!ReadTarget(environment, request)) {
    cgi.refusal = kBadRequest;
  } else if (HeadSize(request) > kHeadLimit) {
    cgi.refusal = kHeadTooLarge;
  } else {
    cgi.refusal = ReadBody(Variable(environment, "CONTENT_LENGTH"), body, request.body);
  }
  return cgi;
}

}  // namespace web
