#include "http/fields.h"

#include <algorithm>

#include "http/text.h"

namespace web {
namespace {

auto Named(std::string_view name) {
  return [name](const Fields::Field &field) { return IsSameText(field.first, name); };
}

}  // namespace

void Fields::Add(std::string name, std::string value) {
  fields_.emplace_back(std::move(name), std::move(value));
}

void Fields::Set(std::string_view name, std::string value) {
  fields_.erase(std::remove_if(fields_.begin(), fields_.end(), Named(name)), fields_.end());
  Add(std::string(name), std::move(value));
}

const std::string *Fields::Find(std::string_view name) const {
  const auto found = std::find_if(fields_.begin(), fields_.end(), Named(name));
  return found == fields_.end() ? nullptr : &found->second;
}

std::string_view Fields::Get(std::string_view name) const {
  const std::string *found = Find(name);
  return found == nullptr ? std::string_view() : std::string_view(*found);
}

size_t Fields::Count(std::string_view name) const {
  return static_cast<size_t>(std::count_if(fields_.begin(), fields_.end(), Named(name)));
}

}  // namespace web
