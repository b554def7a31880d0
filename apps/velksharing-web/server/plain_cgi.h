#ifndef VELKSHARING_WEB_SERVER_PLAIN_CGI_H
#define VELKSHARING_WEB_SERVER_PLAIN_CGI_H

#include "server/service.h"
#include "server/settings.h"

namespace web {

/// Whether a web server started this process to answer one request by CGI.
bool IsPlainCgi();

/// Answers that request: environment and standard input, to standard output, which is closed then:
/// the web server has the whole answer, whatever this process does behind it.
/// @return the process's exit status; not 0 when the answer could not be given whole.
int ServePlainCgi(const Settings &settings, Service &service);

}  // namespace web

#endif
