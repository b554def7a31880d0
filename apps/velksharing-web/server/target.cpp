#include "server/target.h"

#include <strings.h>

#include <algorithm>

namespace web {
namespace {

bool BeginsWithIgnoringCase(std::string_view text, std::string_view beginning) {
  return text.size() >= beginning.size() &&
         strncasecmp(text.data(), beginning.data(), beginning.size()) == 0;
}

bool IsBlankOrControl(char byte) {
  return static_cast<unsigned char>(byte) <= ' ' || byte == '\x7f';
}

/// Without scheme and host; "" where there is no path behind them.
std::string_view WithoutHost(std::string_view target) {
  for (const std::string_view scheme : {"http://", "https://"}) {
    if (!BeginsWithIgnoringCase(target, scheme)) continue;
    const size_t slash = target.find_first_of("/?", scheme.size());
    return slash == std::string_view::npos ? std::string_view() : target.substr(slash);
  }
  return target;
}

}  // namespace

bool SetTarget(std::string_view target, Request &request) {
  target = WithoutHost(target);
  if (target.empty() || target.front() != '/') return false;
  if (std::any_of(target.begin(), target.end(), IsBlankOrControl)) return false;
  const size_t mark = target.find('?');
  request.path = target.substr(0, mark);
  request.query = mark == std::string_view::npos ? "" : target.substr(mark + 1);
  return true;
}

}  // namespace web
