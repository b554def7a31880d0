#include "http/quality.h"

#include <algorithm>
#include <string>

#include "http/text.h"

namespace web {
namespace {

int Thousandths(std::string_view text) {
  if (text.empty() || text.size() > 5 || (text[0] != '0' && text[0] != '1')) return 0;
  if (text.size() > 1 && text[1] != '.') return 0;
  std::string digits(text.substr(std::min<size_t>(2, text.size())));
  if (!std::ranges::all_of(digits, IsDigit)) return 0;
  digits.resize(3, '0');
  const int quality = (text[0] - '0') * 1000 + std::stoi(digits);
  return quality <= 1000 ? quality : 0;
}

}  // namespace

int QualityOf(std::string_view parameters) {
  while (!parameters.empty()) {
    std::string_view parameter = TakePart(parameters, ';');
    const std::string_view name = Trimmed(TakePart(parameter, '='));
    if (IsSameText(name, "q")) return Thousandths(Trimmed(parameter));
  }
  return 1000;
}

}  // namespace web
