#ifndef VELKSHARING_WEB_HTTP_WIPE_H
#define VELKSHARING_WEB_HTTP_WIPE_H

#include <string>

namespace web {

/// Overwrites the text's memory and empties it. For what held a password or a session identifier.
void Wipe(std::string &text);

}  // namespace web

#endif
