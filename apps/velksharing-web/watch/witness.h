#ifndef VELKSHARING_WEB_WATCH_WITNESS_H
#define VELKSHARING_WEB_WATCH_WITNESS_H

#include <chrono>
#include <optional>
#include <string_view>

#include "audit/record.h"

namespace web::watch {

/// A request that is over.
struct Finished {
  std::string_view route;   ///< As in AccessNote.
  int status = 0;           ///< 0: the connection broke before there was one.
  std::string_view result;  ///< Name of the access API's code; "": it was not asked.
  bool is_login = false;    ///< Whether that is the answer to a login.
  /// From the moment when the request's head was there until its answer was made; nothing when it
  /// was not made here.
  std::optional<std::chrono::microseconds> answer_time;
};

/// Who is told what happens to visitors. Any thread may call; no call waits for anything.
class Witness {
 public:
  virtual ~Witness() = default;

  /// A visitor came, was refused, or went.
  virtual void Keep(const audit::Record &record) = 0;
  virtual void Count(const Finished &request) = 0;
};

}  // namespace web::watch

#endif
