#ifndef OPERATIONS_VERDICT_H
#define OPERATIONS_VERDICT_H

#include <string>

#include "operations/database.h"
#include "operations/secret.h"

namespace operations {

/// Whether a visitor would be let in now, and why not.
struct Verdict {
  bool let_in = false;
  std::string reason;    ///< A fixed word for machines: "used-up", "address-blocked", …
  std::string sentence;  ///< For people, with a full stop.
};

/// What a new login to a link would meet. Writes nothing.
/// @param address the visitor's, as ParseAddress() gives it; "": leave blocks out.
/// @throws Failure DATABASE.
Verdict JudgeLogin(BaseDB &db, const std::string &hash, const std::string &address);

/// Whether a visitor who is logged in would be authorised. Writes nothing.
/// @param address as above; "": the session's own.
Verdict JudgeSession(BaseDB &db, const std::string &hash, const Secret &session_id,
                     const std::string &address);

}  // namespace operations

#endif
