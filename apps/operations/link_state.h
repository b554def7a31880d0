#ifndef OPERATIONS_LINK_STATE_H
#define OPERATIONS_LINK_STATE_H

#include <array>
#include <optional>
#include <string>

#include "velksharing/record.h"

namespace operations {

/// Where a link stands for a new visitor. Every link is in exactly one state; the first that fits
/// in this order counts.
enum LinkState {
  LINK_DISABLED,  ///< Switched off.
  LINK_EXPIRED,   ///< Past its expiry.
  LINK_USED_UP,   ///< Used as often as allowed.
  LINK_PENDING,   ///< Not started yet.
  LINK_ACTIVE     ///< Lets visitors in.
};

constexpr std::array<LinkState, 5> kLinkStates = {LINK_ACTIVE, LINK_PENDING, LINK_USED_UP,
                                                  LINK_EXPIRED, LINK_DISABLED};

/// "active", "disabled", "pending", "expired" or "used-up".
const char *LinkStateName(LinkState state);
std::optional<LinkState> LinkStateFromName(const std::string &name);

/// The state of a link at a moment, in seconds since the Unix epoch.
LinkState StateOf(const VELK::sharing::record::Entry &link, long now);

/// An SQL expression, in brackets, that holds for the rows of "entry" in that state. Made of
/// constants and one number only.
std::string LinkStateExpression(LinkState state, long now);

}  // namespace operations

#endif
