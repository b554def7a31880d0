#include "site/accept.h"

#include <algorithm>
#include <string>

#include "http/text.h"

namespace web {
namespace {

/// A quality in thousandths; 0 for what is none.
int Thousandths(std::string_view text) {
  if (text.empty() || text.size() > 5 || (text[0] != '0' && text[0] != '1')) return 0;
  if (text.size() > 1 && text[1] != '.') return 0;
  std::string digits(text.substr(std::min<size_t>(2, text.size())));
  if (!std::ranges::all_of(digits, IsDigit)) return 0;
  digits.resize(3, '0');
  return std::min(1000, (text[0] - '0') * 1000 + std::stoi(digits));
}

int QualityOf(std::string_view parameters) {
  while (!parameters.empty()) {
    const std::string_view parameter = Trimmed(TakePart(parameters, ';'));
    if (parameter.size() > 2 && (parameter[0] == 'q' || parameter[0] == 'Q') && parameter[1] == '=')
      return Thousandths(parameter.substr(2));
  }
  return 1000;
}

}  // namespace

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
