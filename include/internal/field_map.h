#ifndef VELKSHARING_INTERNAL_FIELD_MAP_H
#define VELKSHARING_INTERNAL_FIELD_MAP_H

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace VELK::sharing::internal {

/// Pairs the names of a record's columns with the texts of its field list, place by place.
template <typename Names>
std::map<std::string, std::string> FieldMap(const Names &names, std::vector<std::string> values) {
  std::map<std::string, std::string> map;
  std::size_t i = 0;
  for (const char *name : names) map.emplace(name, std::move(values[i++]));
  return map;
}

}  // namespace VELK::sharing::internal

#endif
