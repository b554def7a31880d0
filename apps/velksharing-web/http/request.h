#ifndef VELKSHARING_WEB_HTTP_REQUEST_H
#define VELKSHARING_WEB_HTTP_REQUEST_H

#include <optional>
#include <string>

#include "http/fields.h"

namespace web {

/// A web server's question whether a visitor may see something that it serves itself.
struct Question {
  std::string address;         ///< What the visitor asked that server for, whole; "" when unclear.
  bool is_authorizer = false;  ///< Whether it takes 200, and nothing else, for a yes.
};

/// A visitor's request, as every way of running the program hands it over: read whole, within the
/// limits of head and form, and otherwise unchecked.
struct Request {
  std::string method;  ///< As sent: "GET".
  std::string path;    ///< As sent, percent-encoded: "/sharing/aB3xK9pQ2/a%20b".
  std::string query;   ///< As sent, without the question mark; "" for none.
  Fields headers;      ///< Not those that only concern the connection.
  std::string body;
  std::string remote_address;  ///< The visitor's, as text: "192.0.2.7".
  bool is_https = false;       ///< Whether the visitor came by https.
  /// Where there is one, method, path, query and body are the web server's own, and mean nothing.
  std::optional<Question> question;
};

}  // namespace web

#endif
