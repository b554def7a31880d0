#ifndef VELKSHARING_WEB_SITE_USE_LOCK_H
#define VELKSHARING_WEB_SITE_USE_LOCK_H

#include <chrono>
#include <string>

#include "http/unique_fd.h"

namespace web {

/// Keeps the other processes away from one link while this one counts a use of it: the library
/// reads the count in one statement and writes it in another.
///
/// Each link is one byte of one file, which stays empty. The kernel lets go of a lock when its
/// process ends, however it does.
class UseLock {
 public:
  /// Waits for the lock, at most `patience`.
  /// @param folder where the file lies, or is made.
  /// @param link_id row id of the link.
  UseLock(const std::string &folder, int link_id, std::chrono::milliseconds patience);
  UseLock(const UseLock &) = delete;
  UseLock &operator=(const UseLock &) = delete;
  ~UseLock();

  /// Whether it is held; otherwise the log says why.
  bool IsHeld() const { return is_held_; }

 private:
  UniqueFd file_;
  int link_id_;
  bool is_held_ = false;
};

}  // namespace web

#endif
