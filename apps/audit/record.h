#ifndef AUDIT_RECORD_H
#define AUDIT_RECORD_H

#include <cstdint>
#include <optional>
#include <string>

namespace audit {

/// What a visitor did. The numbers are stored: they keep their meaning.
enum class Event {
  LOGIN = 1,   ///< Tried to log in.
  ENTER = 2,   ///< Entered a link that asks for nothing.
  LOGOUT = 3,  ///< Left.
};

/// One line of the audit trail. It names a link by its row id: the hash opens links.
struct Record {
  int64_t time = 0;  ///< Microseconds since the Unix epoch.
  int entry_id = 0;
  Event event = Event::LOGIN;
  int result = 0;  ///< VelkSharingLoginResult; of a logout 1 or 0.
  std::optional<unsigned int> uid;
  std::string address;  ///< As much of it as the configuration lets be kept; "" for nothing.
};

}  // namespace audit

#endif
