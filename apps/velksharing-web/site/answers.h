#ifndef VELKSHARING_WEB_SITE_ANSWERS_H
#define VELKSHARING_WEB_SITE_ANSWERS_H

#include <json/value.h>

#include <string>

#include "http/request.h"
#include "http/response.h"
#include "pages/pages.h"

namespace web {

/// What a client is told in JSON: a result code of the access API with its name. Code 0 and no
/// name: the API was not asked, and the status speaks for itself.
struct Result {
  int code = 0;
  std::string name;
};

/// Makes answers in the form and the language that a client asks for: pages for people, JSON for
/// programs.
class Answers {
 public:
  Answers(const Pages &pages, const Request &request);

  /// A page in HTML.
  Response Page(int status, std::string html) const;
  /// A JSON document.
  Response Json(int status, const Json::Value &document) const;
  /// A result, and nothing else, in JSON.
  Response Json(int status, const Result &result) const;
  /// Explains a status that is an error: by a page, or by the result in JSON. A number of seconds
  /// for `retry_after` tells when another try makes sense.
  Response Error(int status, const Result &result = {}, long retry_after = 0) const;
  /// 303 to an address that may stand in a header as it is.
  Response SeeOther(const std::string &address) const;

  bool wants_json() const { return wants_json_; }
  const std::string &language() const { return language_; }

 private:
  const Pages &pages_;
  const bool wants_json_;
  const std::string language_;
};

/// The members "code" and "name" of a result.
Json::Value JsonOf(const Result &result);

}  // namespace web

#endif
