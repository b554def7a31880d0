#include "site/accept.h"

#include <strings.h>

#include <algorithm>
#include <string>

namespace web {
namespace {

std::string_view Trimmed(std::string_view text) {
  const size_t begin = text.find_first_not_of(" \t");
  if (begin == std::string_view::npos) return {};
  return text.substr(begin, text.find_last_not_of(" \t") - begin + 1);
}

bool IsSame(std::string_view one, std::string_view other) {
  return one.size() == other.size() && strncasecmp(one.data(), other.data(), one.size()) == 0;
}

/// Takes the part before `separator` away from the front of `text`.
std::string_view NextPart(std::string_view &text, char separator) {
  const size_t end = std::min(text.find(separator), text.size());
  const std::string_view part = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return Trimmed(part);
}

bool IsDigits(std::string_view text) {
  return std::ranges::all_of(text, [](char byte) { return byte >= '0' && byte <= '9'; });
}

/// A quality in thousandths; 0 for what is none.
int Thousandths(std::string_view text) {
  if (text.empty() || text.size() > 5 || (text[0] != '0' && text[0] != '1')) return 0;
  if (text.size() > 1 && text[1] != '.') return 0;
  std::string digits(text.substr(std::min<size_t>(2, text.size())));
  if (!IsDigits(digits)) return 0;
  digits.resize(3, '0');
  return std::min(1000, (text[0] - '0') * 1000 + std::stoi(digits));
}

int QualityOf(std::string_view parameters) {
  while (!parameters.empty()) {
    const std::string_view parameter = NextPart(parameters, ';');
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
    std::string_view range = NextPart(accept, ',');
    const std::string_view type = NextPart(range, ';');
    const int quality = QualityOf(range);
    if (IsSame(type, "application/json")) {
      json = std::max(json, quality);
    } else if (IsSame(type, "text/html") || IsSame(type, "application/xhtml+xml")) {
      html = std::max(html, quality);
    } else if (type == "*/*" || IsSame(type, "text/*")) {
      any = std::max(any, quality);
    }
  }
  if (json <= 0) return false;
  return html == kNotNamed ? json >= any : json > html;
}

}  // namespace web
