#ifndef VELKSHARING_WEB_SITE_SESSION_IDS_H
#define VELKSHARING_WEB_SITE_SESSION_IDS_H

#include <string>
#include <string_view>
#include <vector>

#include "http/request.h"

/// Where requests carry the identifiers of sessions.

namespace web {

/// Whether a text can be a session's identifier.
bool IsSessionId(std::string_view text);

/// The field in which API clients send a session's identifier; null when there is none.
const std::string *FindSessionField(const Request &request);

/// The cookie by which a visitor of a link is known on the pages that the link guards. Each link
/// has its own: the cookies of all of them may come together.
std::string GuardCookieName(const std::string &hash);

/// The sessions by which a visitor may be in at a link that guards what he asks for: of the header
/// field, or of the cookies, of which browsers may send several. Four at most.
std::vector<std::string> ClaimedGuardSessions(const Request &request, const std::string &hash);

}  // namespace web

#endif
