#include <charconv>
#include <limits>
#include <locale>
#include <sstream>

#include "velk/velkdb.h"
#include "velksharing/database.h"

namespace VELK::sharing::db {
namespace {

bool IsBlank(char character) {
  return character == ' ' || (character >= '\t' && character <= '\r');
}

/// A whole number as formatted stream extraction reads it, without the cost of a stream.
struct WholeNumber {
  bool read = false;    ///< Whether there were digits, and not too many.
  bool at_end = false;  ///< Whether the text ended with them.
  bool negative = false;
  unsigned long long magnitude = 0;
};

WholeNumber ReadWholeNumber(const std::string &text) {
  const char *at = text.data();
  const char *const end = at + text.size();
  while (at != end && IsBlank(*at)) ++at;
  WholeNumber number;
  if (at != end && (*at == '-' || *at == '+')) number.negative = *at++ == '-';
  const auto [stop, error] = std::from_chars(at, end, number.magnitude);
  number.read = error == std::errc();
  number.at_end = stop == end;
  return number;
}

/// The number as a T.
/// @return false when it is out of T's range. As with streams, a negative number is read into an
///         unsigned type modulo its size when its magnitude fits.
template <typename T>
bool Fit(const WholeNumber &number, T &value) {
  constexpr auto kMax = static_cast<unsigned long long>(std::numeric_limits<T>::max());
  const bool has_lower_minimum = number.negative && std::numeric_limits<T>::is_signed;
  if (number.magnitude > kMax + (has_lower_minimum ? 1 : 0)) return false;
  value = static_cast<T>(number.negative ? 0 - number.magnitude : number.magnitude);
  return true;
}

template <typename T>
T Convert(const std::string &text, T def, bool &used_up) {
  if (used_up) return def;
  const WholeNumber number = ReadWholeNumber(text);
  T value = def;
  const bool converted = number.read && Fit(number, value);
  used_up = !converted || number.at_end;
  return value;
}

}  // namespace

Field::Field(const std::string &text) : text_(text) {}
Field::Field(std::string &&text) noexcept : text_(std::move(text)) {}
Field::Field(const Field &other) = default;
Field::Field(Field &&other) noexcept = default;
Field &Field::operator=(const Field &other) = default;
Field &Field::operator=(Field &&other) noexcept = default;
Field::~Field() = default;

// Every conversion starts at the beginning of the text anyway.
void Field::Clear() {}

int Field::AsInt(int def) {
  return Convert(text_, def, used_up_);
}

unsigned int Field::AsUInt(unsigned int def) {
  return Convert(text_, def, used_up_);
}

long Field::AsTime(long def) {
  return Convert(text_, def, used_up_);
}

float Field::AsFloat(float def) {
  if (used_up_) return def;
  std::istringstream stream(text_);
  stream.imbue(std::locale::classic());
  float value = def;
  const bool converted = static_cast<bool>(stream >> value);
  used_up_ = !stream.good();
  return converted ? value : def;
}

const std::string &Field::AsString(const std::string &) {
  return text_;
}

bool Field::AsBool(bool) {
  return text_ == "1";
}

Row::Row() = default;
Row::Row(DBResult_tag *result, unsigned int row) : result_(result), row_(row) {}
Row::Row(const Row &other) = default;
Row &Row::operator=(const Row &other) = default;
Row::~Row() = default;

bool Row::IsGood() const {
  return result_ != nullptr;
}

void Row::SetResult(DBResult_tag *result) {
  result_ = result;
}

void Row::SetRow(unsigned int row) {
  row_ = row;
}

Field Row::GetField(const std::string &name) const {
  return Field(std::string(IsGood() ? VELKDBFetchField(result_, row_, name.c_str()) : ""));
}

Result::Result() = default;
Result::Result(DBResult_tag *handle) : handle_(handle) {}
Result::~Result() {
  if (handle_ != nullptr) VELKDBFreeResult(handle_);
}

bool Result::IsGood() const {
  return handle_ != nullptr;
}

void Result::SetResult(DBResult_tag *handle) {
  handle_ = handle;
}

bool Result::NextRow(Row &row) {
  if (VELKDBFetchRow(handle_, &row_) == -1) return false;
  row.SetResult(handle_);
  row.SetRow(row_);
  return true;
}

}  // namespace VELK::sharing::db
