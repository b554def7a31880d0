#ifndef VELKSHARING_WEB_SITE_FORM_TOKEN_H
#define VELKSHARING_WEB_SITE_FORM_TOKEN_H

#include <string>
#include <string_view>

#include "http/request.h"

namespace web {

/// The hidden field of every form that is posted, by which we know our own forms again.
///
/// A visitor's browser keeps a random key in a cookie; the token is a keyed digest of that key and
/// the link. So a page of somebody else, which sees neither, cannot post in the visitor's name,
/// and a token of one link is worth nothing for another.
class FormTokens {
 public:
  /// @param secret known to nobody but the processes that serve the same visitors.
  explicit FormTokens(std::string secret);
  FormTokens(const FormTokens &) = delete;
  FormTokens &operator=(const FormTokens &) = delete;
  ~FormTokens();

  /// A new key for a browser; "" when there is no randomness to be had.
  static std::string NewKey();
  /// Whether a text has the form of a key.
  static bool IsKey(std::string_view text);

  /// The token of a link's forms for a browser: 64 hexadecimal digits. "" when the digest is not
  /// to be had, which no form is right with.
  std::string Token(std::string_view key, std::string_view hash) const;
  /// Whether a form brought the token that belongs to the browser and the link. Compares in
  /// constant time.
  bool IsRight(std::string_view token, std::string_view key, std::string_view hash) const;

 private:
  std::string secret_;
};

/// Whether a request, as far as the browser tells, does not come from a page of somebody else.
/// What is not from a browser tells nothing, and passes.
bool IsFromOwnPage(const Request &request);

}  // namespace web

#endif
