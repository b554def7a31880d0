#include "share/byte_range.h"

#include <algorithm>
#include <limits>
#include <optional>

#include "http/text.h"

namespace web::share {
namespace {

constexpr std::string_view kUnit = "bytes=";

// "5-9" is first and last; "5-" has no last, "-5" (the last five bytes) no first.
struct Spec {
  std::optional<off_t> first;
  std::optional<off_t> last;
};

// A number too large for a file is as good as the largest.
off_t ToNumber(std::string_view digits) {
  constexpr off_t kLargest = std::numeric_limits<off_t>::max();
  off_t number = 0;
  for (const char digit : digits) {
    if (number > (kLargest - 9) / 10) return kLargest;
    number = number * 10 + (digit - '0');
  }
  return number;
}

std::optional<Spec> ParseSpec(std::string_view text) {
  const size_t dash = text.find('-');
  if (dash == std::string_view::npos) return std::nullopt;
  const std::string_view first = text.substr(0, dash);
  const std::string_view last = text.substr(dash + 1);
  if (first.empty() && last.empty()) return std::nullopt;
  if (!std::all_of(first.begin(), first.end(), IsDigit)) return std::nullopt;
  if (!std::all_of(last.begin(), last.end(), IsDigit)) return std::nullopt;
  Spec spec;
  if (!first.empty()) spec.first = ToNumber(first);
  if (!last.empty()) spec.last = ToNumber(last);
  if (spec.first && spec.last && *spec.first > *spec.last) return std::nullopt;
  return spec;
}

ByteRange Suffix(off_t wanted, off_t size) {
  if (wanted == 0) return {ByteRange::Kind::UNSATISFIABLE, 0, 0};
  // The end of nothing is nothing, which no Content-Range can say.
  if (size == 0) return {};
  const off_t length = std::min(wanted, size);
  return {ByteRange::Kind::PART, size - length, length};
}

ByteRange Apply(const Spec &spec, off_t size) {
  if (!spec.first) return Suffix(*spec.last, size);
  if (*spec.first >= size) return {ByteRange::Kind::UNSATISFIABLE, 0, 0};
  const off_t last = std::min(spec.last.value_or(size - 1), size - 1);
  return {ByteRange::Kind::PART, *spec.first, last - *spec.first + 1};
}

bool HasUnit(std::string_view field) {
  return IsSameText(field.substr(0, kUnit.size()), kUnit);
}

}  // namespace

ByteRange ParseRange(std::string_view field, off_t size) {
  field = Trimmed(field);
  if (!HasUnit(field)) return {};
  field.remove_prefix(kUnit.size());

  size_t ranges = 0;
  ByteRange range;
  bool is_any_satisfiable = false;
  while (!field.empty()) {
    const std::string_view text = Trimmed(TakePart(field, ','));
    if (text.empty()) continue;
    const std::optional<Spec> spec = ParseSpec(text);
    if (!spec) return {};
    ++ranges;
    range = Apply(*spec, size);
    if (range.kind != ByteRange::Kind::UNSATISFIABLE) is_any_satisfiable = true;
  }
  if (ranges == 0) return {};
  if (!is_any_satisfiable) return {ByteRange::Kind::UNSATISFIABLE, 0, 0};
  return ranges == 1 ? range : ByteRange();
}

}  // namespace web::share
