#ifndef VELKSHARING_WEB_GATE_GUARDED_PREFIX_H
#define VELKSHARING_WEB_GATE_GUARDED_PREFIX_H

#include <string>

#include "gate/prefix.h"

namespace web::gate {

/// A prefix that the configuration puts behind a link.
struct GuardedPrefix {
  Prefix prefix;
  std::string hash;
};

}  // namespace web::gate

#endif
