#include "share/natural_order.h"

#include <algorithm>

#include "http/text.h"

namespace web::share {
namespace {

int Rank(char character) {
  const bool is_upper = character >= 'A' && character <= 'Z';
  return static_cast<unsigned char>(is_upper ? character - 'A' + 'a' : character);
}

// Takes the digits at the beginning of `text`, without the zeros in front.
std::string_view TakeNumber(std::string_view &text) {
  const auto end = std::find_if_not(text.begin(), text.end(), IsDigit);
  std::string_view number = text.substr(0, static_cast<size_t>(end - text.begin()));
  text.remove_prefix(number.size());
  number.remove_prefix(std::min(number.find_first_not_of('0'), number.size()));
  return number;
}

int CompareNumbers(std::string_view left, std::string_view right) {
  if (left.size() != right.size()) return left.size() < right.size() ? -1 : 1;
  return left.compare(right);
}

int CompareLoosely(std::string_view left, std::string_view right) {
  while (!left.empty() && !right.empty()) {
    int difference = 0;
    if (IsDigit(left.front()) && IsDigit(right.front())) {
      difference = CompareNumbers(TakeNumber(left), TakeNumber(right));
    } else {
      difference = Rank(left.front()) - Rank(right.front());
      left.remove_prefix(1);
      right.remove_prefix(1);
    }
    if (difference != 0) return difference;
  }
  return static_cast<int>(!left.empty()) - static_cast<int>(!right.empty());
}

}  // namespace

int CompareNaturally(std::string_view left, std::string_view right) {
  const int difference = CompareLoosely(left, right);
  return difference != 0 ? difference : left.compare(right);
}

}  // namespace web::share
