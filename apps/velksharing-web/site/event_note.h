#ifndef VELKSHARING_WEB_SITE_EVENT_NOTE_H
#define VELKSHARING_WEB_SITE_EVENT_NOTE_H

#include <string>

#include "site/link.h"
#include "site/site.h"

/// What the audit trail keeps of a visitor's coming and going. To be called when the note has the
/// code already.

namespace web {

/// @param session_id of the session that the login made; "" when it made none.
void NoteLogin(const Link &link, const std::string &session_id, AccessNote &note);

/// @param hash of a link that may be gone or damaged.
/// @param session_id what the visitor brought; need not be a session's.
void NoteLogout(const std::string &hash, const std::string &session_id, AccessNote &note);

}  // namespace web

#endif
