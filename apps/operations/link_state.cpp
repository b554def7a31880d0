#include "operations/link_state.h"

namespace operations {

const char *LinkStateName(LinkState state) {
  switch (state) {
    case LINK_DISABLED:
      return "disabled";
    case LINK_EXPIRED:
      return "expired";
    case LINK_USED_UP:
      return "used-up";
    case LINK_PENDING:
      return "pending";
    case LINK_ACTIVE:
      return "active";
  }
  return "";
}

std::optional<LinkState> LinkStateFromName(const std::string &name) {
  for (const LinkState state : kLinkStates)
    if (name == LinkStateName(state)) return state;
  return std::nullopt;
}

LinkState StateOf(const VELK::sharing::record::Entry &link, long now) {
  if (!link.get_enabled()) return LINK_DISABLED;
  if (link.get_expire_at() > 0 && link.get_expire_at() < now) return LINK_EXPIRED;
  if (link.get_expire_times() > 0 && link.get_use_count() >= link.get_expire_times())
    return LINK_USED_UP;
  if (link.get_start_at() > now) return LINK_PENDING;
  return LINK_ACTIVE;
}

std::string LinkStateExpression(LinkState state, long now) {
  const std::string disabled = "enabled <> 1";
  const std::string expired = "(expire_at > 0 AND expire_at < " + std::to_string(now) + ")";
  const std::string used_up = "(expire_times > 0 AND use_count >= expire_times)";
  const std::string pending = "(start_at > " + std::to_string(now) + ")";
  switch (state) {
    case LINK_DISABLED:
      return "(" + disabled + ")";
    case LINK_EXPIRED:
      return "(enabled = 1 AND " + expired + ")";
    case LINK_USED_UP:
      return "(enabled = 1 AND NOT " + expired + " AND " + used_up + ")";
    case LINK_PENDING:
      return "(enabled = 1 AND NOT " + expired + " AND NOT " + used_up + " AND " + pending + ")";
    case LINK_ACTIVE:
      return "(enabled = 1 AND NOT " + expired + " AND NOT " + used_up + " AND NOT " + pending +
             ")";
  }
  return "(0)";
}

}  // namespace operations
