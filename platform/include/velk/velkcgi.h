#ifndef VELK_VELKCGI_H
#define VELK_VELKCGI_H

#include <stddef.h>

#include "velk/export.h"

/// The web request that the process is serving, and the login of an account.
///
/// Under plain CGI there is nothing to do: the request is the process's environment, and its body
/// is standard input, which is read at most once and only when a parameter is looked for in it.
/// What was read is kept until the process exits, and wiped then: one such process serves one
/// request. A program that serves several requests, or that reads the request body itself, hands
/// each request over first:
///
///     VelkCgiRequest request = {envp, body, body_length};
///     VelkCgiRequestBegin(&request);
///     …serve it…
///     VelkCgiRequestEnd();
///
/// The current request is a thread's own; every call looks at it as it stands then. Which address
/// is the client's is decided by the web server in REMOTE_ADDR; forwarding headers are never read.

#ifdef __cplusplus
extern "C" {
#endif

/// A request handed over by the program that serves it. Everything, this record included, stays
/// the caller's and must live until VelkCgiRequestEnd().
typedef struct VelkCgiRequest_tag {
  const char *const *environment;  ///< "NAME=value" texts, ended by null, as CGI defines them.
  const char *body;                ///< The request body; may be null when `body_length` is 0.
  size_t body_length;              ///< In bytes.
} VelkCgiRequest;

/// Makes `request` this thread's current request until VelkCgiRequestEnd() or the next begin. Null
/// is the same as VelkCgiRequestEnd().
VELK_PLATFORM_API void VelkCgiRequestBegin(const VelkCgiRequest *request);

/// This thread goes back to the process's environment and standard input.
VELK_PLATFORM_API void VelkCgiRequestEnd(void);

typedef struct VelkCgi_tag VelkCgi;  ///< One view of the current request; one thread at a time.

/// What VelkCgiLogin() checks. Texts stay the caller's and are not kept.
typedef struct VelkCgiLoginRecord_tag {
  const char *name;      ///< Account name.
  const char *password;  ///< Its password.
  const char *client;    ///< Kind of client, for example "webui".
  int number1;           ///< Not read here.
  int number2;           ///< Not read here.
} VelkCgiLoginRecord;

/// Makes a view of the current request.
/// @param cgi receives it, to be freed with VelkCgiFree(); null on failure.
/// @param reserved always "".
/// @return 1, or 0 on failure.
VELK_PLATFORM_API int VelkCgiInit(VelkCgi **cgi, const char *reserved);

/// Reads the request's cookies (HTTP_COOKIE) into the view; those that it has already stay as they
/// are. The first of equal names counts; what is no well-formed cookie is passed over.
/// @return 1, or 0 for a null view.
VELK_PLATFORM_API int VelkCgiLoadInCookies(VelkCgi *cgi);

/// A cookie of the view.
/// @return its value, owned by the view and valid until that cookie is stored anew or the view is
///         freed; null when there is none.
VELK_PLATFORM_API const char *VelkCgiGetCookie(VelkCgi *cgi, const char *name);

/// A parameter of the request: of QUERY_STRING, else of an
/// "application/x-www-form-urlencoded" body of at most 1 MiB. A body that is larger, or shorter
/// than announced, counts as absent; standard input is looked at only for the method POST.
/// @return the decoded text, owned by the view until VelkCgiFree(), or `fallback`. The first of
///         equal names counts, an escape that is none ("%zz") stands for itself, and a value that
///         holds an encoded zero byte counts as absent.
VELK_PLATFORM_API const char *VelkCgiGetRequestParam(VelkCgi *cgi, const char *name,
                                                     const char *fallback);

/// Stores a cookie in the view, in place of one with the same name. Nothing is sent, so the
/// attributes are not looked at.
/// @return 1, or 0: null view, a name that is no token, a value with characters that no cookie
///         may hold.
VELK_PLATFORM_API int VelkCgiSetCookies(VelkCgi *cgi, const char *name, const char *value,
                                        long expires, const char *path, const char *domain,
                                        int secure);

/// Checks an account's name and password, through saslauthd where one answers on its socket, else
/// through the PAM service "velk" in this process. Locked and expired accounts are refused, and so
/// are names and passwords that are empty, longer than 256 bytes or hold a control byte. What
/// saslauthd refuses, or does not answer within 10 seconds (a full queue included), is not tried
/// again through PAM, and neither is what cannot be asked for lack of descriptors or memory. The
/// password is not kept; buffers that held it are wiped. May wait for seconds: authenticators
/// delay the answer to a wrong password.
/// @param name_out receives the account's name as the authenticator reports it (saslauthd reports
///        none: the name as given); may be null when `capacity` is 0.
/// @return 1 the account is who it says; 0 refused or failed, also when the name does not fit.
VELK_PLATFORM_API int VelkCgiLogin(VelkCgi *cgi, char *name_out, size_t capacity,
                                   VelkCgiLoginRecord *record);

/// The client's address: REMOTE_ADDR, parsed and printed again by the C library (an IPv4 address
/// written as IPv6 becomes IPv4, a zone id is dropped).
/// @return 0, or -1: no such variable, not an address, or no room in `out`.
VELK_PLATFORM_API int VelkCgiGetRemoteIP(char *out, size_t capacity);

/// @return 1 when the address is blocked now, else 0 (also when that cannot be known).
VELK_PLATFORM_API int VelkCgiIsDeniedIP(const char *ip);

/// Frees a view and wipes what it held. Accepts null.
VELK_PLATFORM_API void VelkCgiFree(VelkCgi *cgi);

#ifdef __cplusplus
}
#endif

#endif
