#include "site/answers.h"

#include <json/writer.h>

#include <utility>

#include "site/accept.h"

namespace web {
namespace {

/// The name of a status for which there is no result.
const char *StatusName(int status) {
  switch (status) {
    case 400:
      return "BAD_REQUEST";
    case 401:
      return "UNAUTHORIZED";
    case 403:
      return "FORBIDDEN";
    case 404:
      return "NOT_FOUND";
    case 405:
      return "METHOD_NOT_ALLOWED";
    case 408:
      return "REQUEST_TIMEOUT";
    case 413:
      return "CONTENT_TOO_LARGE";
    case 414:
      return "URI_TOO_LONG";
    case 415:
      return "UNSUPPORTED_MEDIA_TYPE";
    case 429:
      return "TOO_MANY_REQUESTS";
    case 431:
      return "REQUEST_HEADER_FIELDS_TOO_LARGE";
    case 500:
      return "INTERNAL_SERVER_ERROR";
    case 503:
      return "SERVICE_UNAVAILABLE";
  }
  return "ERROR";
}

std::string Written(const Json::Value &document) {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "";
  // Whatever bytes a name has: what is not ASCII is escaped, what is not UTF-8 replaced.
  builder["emitUTF8"] = false;
  return Json::writeString(builder, document) + "\n";
}

}  // namespace

Answers::Answers(const Pages &pages, const Request &request)
    : pages_(pages),
      wants_json_(PrefersJson(request.headers.Get("Accept"))),
      language_(pages.ChooseLanguage(request.headers.Get("Accept-Language"))) {}

Response Answers::Page(int status, std::string html) const {
  Response response;
  response.status = status;
  response.headers.Add("Content-Type", std::string(Pages::kContentType));
  response.body = std::move(html);
  return response;
}

Response Answers::Json(int status, const Json::Value &document) const {
  Response response;
  response.status = status;
  response.headers.Add("Content-Type", "application/json");
  response.body = Written(document);
  return response;
}

Response Answers::Json(int status, const Result &result) const {
  return Json(status, JsonOf(result));
}

Response Answers::Error(int status, const Result &result, long retry_after) const {
  Response response =
      wants_json_ ? Json(status, result.name.empty() ? Result{0, StatusName(status)} : result)
                  : Page(status, pages_.Message({language_, ""}, status, retry_after));
  if (retry_after > 0) response.headers.Add("Retry-After", std::to_string(retry_after));
  return response;
}

Response Answers::SeeOther(const std::string &address) const {
  Response response;
  response.status = 303;
  response.headers.Add("Location", address);
  return response;
}

Json::Value JsonOf(const Result &result) {
  Json::Value document(Json::objectValue);
  document["code"] = result.code;
  document["name"] = result.name;
  return document;
}

}  // namespace web
