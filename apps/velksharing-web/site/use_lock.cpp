#include "site/use_lock.h"

#include <fcntl.h>
#include <syslog.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <thread>

namespace web {
namespace {

using std::chrono::milliseconds;

struct flock OneByte(short type, int link_id) {
  struct flock range = {};
  range.l_type = type;
  range.l_whence = SEEK_SET;
  range.l_start = link_id;
  range.l_len = 1;
  return range;
}

/// Belongs to the open file and not to the process, so that nobody who closes the same file
/// elsewhere in this process lets go of it.
bool TryToLock(int file, int link_id) {
  struct flock range = OneByte(F_WRLCK, link_id);
  return fcntl(file, F_OFD_SETLK, &range) == 0;
}

bool IsHeldElsewhere(int error) {
  return error == EAGAIN || error == EACCES || error == EINTR;
}

}  // namespace

UseLock::UseLock(const std::string &folder, int link_id, milliseconds patience)
    : file_(open((folder + "/uses.lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600)),
      link_id_(link_id) {
  if (!file_.IsOpen()) {
    syslog(LOG_ERR, "cannot open %s/uses.lock: %s", folder.c_str(), std::strerror(errno));
    return;
  }
  const auto end = std::chrono::steady_clock::now() + patience;
  // Waiting inside of the kernel knows no end, and one process that hangs would stop all others.
  for (milliseconds pause(1);; pause = std::min(2 * pause, milliseconds(16))) {
    is_held_ = TryToLock(file_.get(), link_id_);
    if (is_held_ || !IsHeldElsewhere(errno) || std::chrono::steady_clock::now() >= end) break;
    std::this_thread::sleep_for(pause);
  }
  if (!is_held_)
    syslog(LOG_ERR, "cannot lock the uses of link %d: %s", link_id_, std::strerror(errno));
}

UseLock::~UseLock() {
  if (!is_held_) return;
  // Closing alone would leave the lock to a child that was started meanwhile and has not come to
  // its exec yet.
  struct flock range = OneByte(F_UNLCK, link_id_);
  fcntl(file_.get(), F_OFD_SETLK, &range);
}

}  // namespace web
