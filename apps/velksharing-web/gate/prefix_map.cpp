#include "gate/prefix_map.h"

#include <algorithm>

namespace web::gate {
namespace {

const std::vector<std::string> kNoKeys;

}  // namespace

void PrefixMap::Add(const Prefix &prefix, std::string_view key) {
  std::vector<std::string> &keys = keys_[prefix.origin() + prefix.path().text()];
  const auto place = std::ranges::lower_bound(keys, key);
  if (place == keys.end() || *place != key) keys.emplace(place, key);
  longest_ = std::max(longest_, prefix.path().text().size());
}

const std::vector<std::string> &PrefixMap::Find(const Address &address) const {
  const std::vector<std::string> *agreed = nullptr;
  for (const Reading &reading : address.readings()) {
    const std::vector<std::string> &keys = KeysOf(address.origin(), reading);
    if (agreed == nullptr) agreed = &keys;
    if (keys != *agreed) return kNoKeys;
  }
  return *agreed;
}

const std::vector<std::string> &PrefixMap::KeysOf(const std::string &origin,
                                                  const Reading &reading) const {
  const std::vector<std::string> *keys = KeysOnSite(origin, reading.text());
  if (keys == nullptr) keys = KeysOnSite("", reading.text());
  return keys == nullptr ? kNoKeys : *keys;
}

const std::vector<std::string> *PrefixMap::KeysOnSite(const std::string &origin,
                                                      std::string_view path) const {
  if (path.size() > longest_) path = path.substr(0, path.rfind(Reading::kSeparator, longest_));
  std::string place = origin;
  place += path;
  for (;;) {
    const auto found = keys_.find(place);
    if (found != keys_.end()) return &found->second;
    if (place.size() == origin.size()) return nullptr;
    place.resize(place.rfind(Reading::kSeparator));
  }
}

}  // namespace web::gate
