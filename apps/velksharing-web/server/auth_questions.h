#ifndef VELKSHARING_WEB_SERVER_AUTH_QUESTIONS_H
#define VELKSHARING_WEB_SERVER_AUTH_QUESTIONS_H

#include <string>

#include "http/request.h"
#include "server/settings.h"

namespace web {

/// The FastCGI parameter by which a web server asks whether a visitor may see something of its own:
/// the whole address of that. Never REQUEST_URI: in a question nginx has there what the visitor
/// asked for, which could be one of our own pages, and their 200 would let him in.
inline constexpr char kQuestionParameter[] = "VELK_SHARING_AUTH";

/// Tells questions of web servers from requests for pages, and takes out of them what they are
/// about.
///
/// Where that stands is a setting and never guessed: a web server that sets one header field passes
/// a visitor's own fields of the other names on. A question that comes in another way than the
/// setting says is still one, and has no address.
class AuthQuestions {
 public:
  explicit AuthQuestions(const Settings &settings);

  /// Makes an HTTP request a question when its path is that of the endpoint.
  /// @param is_trusted whether it comes from a web server whose word counts.
  void Recognise(Request &request, bool is_trusted) const;

  /// Whether "NAME=value" texts, which end with null, are a question.
  /// @param is_authorizer whether they came with the FastCGI role of that name.
  static bool Is(const char *const *environment, bool is_authorizer);

  /// The question.
  Request Read(const char *const *environment, bool is_authorizer) const;

 private:
  std::string AddressFrom(const Fields &fields) const;
  std::string AddressFrom(const char *const *environment, bool is_authorizer) const;

  const AuthAddress source_;
  const std::string endpoint_;
};

}  // namespace web

#endif
