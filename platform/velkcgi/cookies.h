#ifndef VELKCGI_COOKIES_H
#define VELKCGI_COOKIES_H

#include <functional>
#include <map>
#include <string>
#include <string_view>

#include "secret.h"

namespace velk {

/// Cookies by name. Their values are wiped when they go.
class Cookies {
 public:
  /// Adds those of a Cookie header that are not there yet. What is no cookie is passed over.
  void Load(std::string_view header);

  /// Adds or replaces one.
  /// @return false when the name is no token or the value holds what no cookie may hold.
  bool Set(std::string_view name, std::string_view value);

  /// Null when there is none. The text stays valid until that cookie is replaced.
  const char *Find(std::string_view name) const;

 private:
  std::map<std::string, Secret, std::less<>> values_;
};

}  // namespace velk

#endif
