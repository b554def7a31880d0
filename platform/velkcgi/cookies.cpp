#include "cookies.h"

#include <algorithm>

#include "common/text.h"

namespace velk {
namespace {

constexpr std::string_view kBlanks = " \t";

bool IsTokenCharacter(char c) {
  constexpr std::string_view kSeparators = "()<>@,;:\\\"/[]?={}";
  return c > ' ' && c < '\x7f' && kSeparators.find(c) == std::string_view::npos;
}

bool IsValueCharacter(char c) {
  return c > ' ' && c < '\x7f' && c != '"' && c != ',' && c != ';' && c != '\\';
}

bool IsCookie(std::string_view name, std::string_view value) {
  return !name.empty() && std::all_of(name.begin(), name.end(), IsTokenCharacter) &&
         std::all_of(value.begin(), value.end(), IsValueCharacter);
}

/// Browsers may send a value in quotes, which do not belong to it.
std::string_view Unquote(std::string_view text) {
  const bool quoted = text.size() >= 2 && text.front() == '"' && text.back() == '"';
  return quoted ? text.substr(1, text.size() - 2) : text;
}

}  // namespace

void Cookies::Load(std::string_view header) {
  while (!header.empty()) {
    const std::string_view pair = header.substr(0, header.find(';'));
    header.remove_prefix(std::min(pair.size() + 1, header.size()));
    const size_t sign = pair.find('=');
    if (sign == std::string_view::npos) continue;
    const std::string_view name = Trim(pair.substr(0, sign), kBlanks);
    const std::string_view value = Unquote(Trim(pair.substr(sign + 1), kBlanks));
    if (IsCookie(name, value)) values_.try_emplace(std::string(name), value);
  }
}

bool Cookies::Set(std::string_view name, std::string_view value) {
  if (!IsCookie(name, value)) return false;
  values_.insert_or_assign(std::string(name), Secret(value));
  return true;
}

const char *Cookies::Find(std::string_view name) const {
  const auto found = values_.find(name);
  return found == values_.end() ? nullptr : found->second.c_str();
}

}  // namespace velk
