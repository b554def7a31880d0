#include "http/form.h"

#include <algorithm>

#include "http/percent.h"
#include "http/text.h"
#include "http/wipe.h"

namespace web {
namespace {

/// Decodes into `out`, which is reserved first: a value may be a password, and a text that grows
/// leaves copies behind.
bool Decode(std::string_view encoded, std::string &out) {
  out.reserve(encoded.size());
  while (!encoded.empty()) {
    const size_t plus = encoded.find('+');
    if (!AppendPercentDecoded(encoded.substr(0, plus), out)) return false;
    if (plus == std::string_view::npos) break;
    out += ' ';
    encoded.remove_prefix(plus + 1);
  }
  return out.find('\0') == std::string::npos;
}

}  // namespace

Form::~Form() {
  for (auto &[name, value] : fields_) {
    Wipe(name);
    Wipe(value);
  }
}

std::optional<Form> Form::Parse(std::string_view encoded) {
  const auto count = static_cast<size_t>(std::count(encoded.begin(), encoded.end(), '&')) + 1;
  if (count > kMostFields) return std::nullopt;
  Form form;
  form.fields_.reserve(count);
  while (!encoded.empty()) {
    std::string_view field = TakePart(encoded, '&');
    if (field.empty()) continue;
    auto &[name, value] = form.fields_.emplace_back();
    if (!Decode(TakePart(field, '='), name) || !Decode(field, value)) return std::nullopt;
  }
  return form;
}

const std::string *Form::Find(std::string_view name) const {
  for (const auto &[field, value] : fields_)
    if (field == name) return &value;
  return nullptr;
}

std::vector<std::string> Form::All(std::string_view name) const {
  std::vector<std::string> values;
  for (const auto &[field, value] : fields_)
    if (field == name) values.push_back(value);
  return values;
}

}  // namespace web
