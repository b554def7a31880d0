#ifndef VELKSHARING_WEB_SITE_VISITOR_H
#define VELKSHARING_WEB_SITE_VISITOR_H

#include <string>

#include "http/form.h"
#include "http/request.h"
#include "http/response.h"
#include "http/wipe.h"
#include "site/form_token.h"

namespace web {

/// Name of the hidden field that holds a form's token.
extern const char *const kFormTokenField;

/// What a visitor's browser brings to one link, and what it is given to keep. Each link has its
/// own cookies: a session of one is never shown to another.
class Visitor {
 public:
  /// @param address of the link, without a slash at its end; the cookies' path.
  /// Everything must outlive this.
  Visitor(const Request &request, const FormTokens &tokens, const std::string &hash,
          const std::string &address);
  Visitor(const Visitor &) = delete;
  Visitor &operator=(const Visitor &) = delete;

  /// The session that the visitor claims to have: from the header field of API clients, else from
  /// the cookie. "" for none, and for what cannot be a session's identifier.
  const std::string &session_id() const { return session_id_.text(); }

  /// Whether the request only looks, without a person who wants to see the answer: HEAD, and what
  /// browsers fetch in advance.
  bool OnlyPeeks() const;

  /// The token for forms of this link.
  std::string FormToken() const;
  /// Whether a form is one of ours and posted from one of our pages. An API client has no form: it
  /// sends its header field, be it empty, which no page can make a browser send to another site.
  bool HasRightForm(const Form &form) const;

  /// Gives the browser what the forms of a page need, unless it has that.
  void KeepFormKey(Response &response) const;
  /// Gives the browser a session.
  /// @return false, with nothing given, when the identifier is none.
  bool KeepSession(Response &response, const std::string &session_id) const;
  /// Makes the browser forget its session.
  void ForgetSession(Response &response) const;

  /// Gives the browser a session for what the link guards, below this path; "" for nothing.
  void KeepGuardSession(Response &response, const std::string &session_id,
                        const std::string &path) const;
  /// Makes the browser forget that one.
  void ForgetGuardSession(Response &response, const std::string &path) const;

 private:
  enum class Fate { KEPT, WITHDRAWN };
  void AddCookie(Response &response, const std::string &name, const std::string &value,
                 const std::string &path, Fate fate) const;

  const Request &request_;
  const FormTokens &tokens_;
  const std::string &hash_;
  const std::string &address_;
  const Secret session_id_;
  const std::string brought_form_key_;  ///< "" for none.
  const std::string form_key_;
};

}  // namespace web

#endif
