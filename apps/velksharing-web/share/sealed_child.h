#ifndef VELKSHARING_WEB_SHARE_SEALED_CHILD_H
#define VELKSHARING_WEB_SHARE_SEALED_CHILD_H

#include <sys/types.h>

#include <functional>
#include <optional>
#include <string>

namespace web::share {

/// What a sealed child may use up.
struct SealedLimits {
  size_t memory = 0;          ///< Bytes of address space beyond what this process has.
  int seconds = 0;            ///< Of processor time, and twice that until it is ended.
  size_t largest_output = 0;  ///< In bytes.
};

/// Runs `work` in a forked copy of this process that can do nothing but compute: no capabilities,
/// no descriptors but one to write its result to, no new ones, no other processes, and a list of
/// the few system calls that computing takes. For code that reads what strangers made.
///
/// Uses no more of the process than memory and the C library's functions for it, so that other
/// threads do not matter. Blocks until the child has ended.
/// @param work gives the result; "" for none. Runs in the child.
/// @return what `work` gave; nothing when that was "" or the child came to a bad end.
std::optional<std::string> RunSealed(const SealedLimits &limits,
                                     const std::function<std::string()> &work);

}  // namespace web::share

#endif
