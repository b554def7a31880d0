#include <climits>
#include <cstring>
#include <string>

#include "common/no_throw.h"
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

int CopyOut(const std::string &text, char *out, size_t capacity) {
  if (text.empty() || text.size() >= capacity || text.size() > INT_MAX) return 0;
  memcpy(out, text.c_str(), text.size() + 1);
  return static_cast<int>(text.size());
}

}  // namespace

int VELKWinsUserNameFqdn2Netbios(const char *name, char *out, size_t capacity) {
  if (name == nullptr || out == nullptr) return 0;
  return velk::NoThrow(0, [&] { return CopyOut(WithShortDomain(name), out, capacity); });
}
