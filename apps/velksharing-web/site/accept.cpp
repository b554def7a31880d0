#include "site/accept.h"

#include <algorithm>

#include "http/quality.h"
#include "http/text.h"

namespace web {
bool PrefersJson(std::string_view accept) {
  constexpr int kNotNamed = -1;
  int json = kNotNamed;
  int html = kNotNamed;
  int any = 0;
  while (!accept.empty()) {
    std::string_view range = TakePart(accept, ',');
    const std::string_view type = Trimmed(TakePart(range, ';'));
    const int quality = QualityOf(range);
    if (IsSameText(type, "application/json")) {
      json = std::max(json, quality);
    } else if (IsSameText(type, "text/html") || IsSameText(type, "application/xhtml+xml")) {
      html = std::max(html, quality);
    } else if (type == "*/*" || IsSameText(type, "text/*")) {
      any = std::max(any, quality);
    }
  }
  if (json <= 0) return false;
  return html == kNotNamed ? json >= any : json > html;
}

}  // namespace web
