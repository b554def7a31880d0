// Any bytes as the body of a form, or as a query: what is read must be what a slow and simple
// reader finds, and what is read must come back when it is encoded and read again.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "http/form.h"
#include "http/percent.h"
#include "require.h"

namespace {

using velk_test::Require;
using web::Form;

using FieldList = std::vector<Form::Field>;

std::vector<std::string> Split(const std::string &text, char separator) {
  std::vector<std::string> parts(1);
  for (const char byte : text) {
    if (byte == separator) {
      parts.emplace_back();
    } else {
      parts.back() += byte;
    }
  }
  return parts;
}

int DigitValue(char digit) {
  return static_cast<int>(std::string_view("0123456789abcdef").find(digit));
}

/// Nothing for what no form holds.
std::optional<std::string> Decoded(const std::string &text) {
  std::string decoded;
  for (size_t at = 0; at < text.size(); ++at) {
    const auto byte = static_cast<unsigned char>(text[at]);
    if (byte <= ' ' || byte == 0x7f) return std::nullopt;
    if (byte == '+') {
      decoded += ' ';
    } else if (byte == '%') {
      if (at + 2 >= text.size() || !isxdigit(static_cast<unsigned char>(text[at + 1])) ||
          !isxdigit(static_cast<unsigned char>(text[at + 2])))
        return std::nullopt;
      const int high = DigitValue(static_cast<char>(tolower(text[at + 1])));
      const int low = DigitValue(static_cast<char>(tolower(text[at + 2])));
      if (high == 0 && low == 0) return std::nullopt;
      decoded += static_cast<char>(high * 16 + low);
      at += 2;
    } else {
      decoded += text[at];
    }
  }
  return decoded;
}

/// Nothing where the form is to be refused.
std::optional<FieldList> ReadSlowly(const std::string &text) {
  const std::vector<std::string> parts = Split(text, '&');
  if (parts.size() > Form::kMostFields) return std::nullopt;
  FieldList fields;
  for (const std::string &part : parts) {
    if (part.empty()) continue;
    const size_t sign = part.find('=');
    const auto name = Decoded(part.substr(0, sign));
    const auto value = Decoded(sign == std::string::npos ? "" : part.substr(sign + 1));
    if (!name || !value) return std::nullopt;
    fields.emplace_back(*name, *value);
  }
  return fields;
}

/// Everything that can be asked of the form is as in the list, and nothing else is in it.
void RequireSame(const Form &form, const FieldList &fields) {
  for (const auto &[name, value] : fields) {
    std::vector<std::string> values;
    for (const auto &[other_name, other_value] : fields)
      if (other_name == name) values.push_back(other_value);
    Require(form.Has(name) && *form.Find(name) == values.front());
    Require(form.All(name) == values);
  }
  Require(!form.Has("a name that is not there"));
}

std::string Encoded(const FieldList &fields) {
  std::string text;
  for (const auto &[name, value] : fields)
    text += "&" + web::PercentEncode(name) + "=" + web::PercentEncode(value);
  return text.empty() ? text : text.substr(1);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  // Comparing takes the square of the fields' number.
  constexpr size_t kLongest = 4096;
  if (size > kLongest) return 0;
  const std::string text(reinterpret_cast<const char *>(data), size);
  const std::optional<Form> form = Form::Parse(text);
  const std::optional<FieldList> fields = ReadSlowly(text);
  Require(form.has_value() == fields.has_value());
  if (!form || fields->size() > 64) return 0;
  RequireSame(*form, *fields);

  const std::optional<Form> again = Form::Parse(Encoded(*fields));
  Require(again.has_value());
  RequireSame(*again, *fields);
  return 0;
}
