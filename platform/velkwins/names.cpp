#include <climits>
#include <string>

#include "common/no_throw.h"
#include "common/text.h"
#include "velk/velkwins.h"
#include "winbind.h"

namespace {

/// "DOMAIN\account" for "realm\account"; "" when it cannot be converted.
std::string WithShortDomain(const std::string &name) {
  const size_t backslash = name.find('\\');
  if (backslash == std::string::npos || backslash == 0) return "";
  if (backslash + 1 == name.size()) return "";
  const std::string domain = velkwins::ShortDomainName(name.substr(0, backslash));
  return domain.empty() ? "" : domain + name.substr(backslash);
}

/// Copies a name that was converted. @return its length, or 0.
int Give(const std::string &text, char *out, size_t capacity) {
  if (text.empty() || text.size() > INT_MAX || !velk::CopyText(text, out, capacity)) return 0;
  return static_cast<int>(text.size());
}

}  // namespace

int VELKWinsUserNameFqdn2Netbios(const char *name, char *out, size_t capacity) {
  if (name == nullptr || out == nullptr) return 0;
  return velk::NoThrow(0, [&] { return Give(WithShortDomain(name), out, capacity); });
}
