#ifndef VELKSHARING_INTERNAL_JSON_H
#define VELKSHARING_INTERNAL_JSON_H

#include <json/value.h>

#include <string>
#include <vector>

namespace VELK::sharing::internal {

/// Parses a JSON text that is not trusted.
/// @return false when it is no JSON or nests past the parser's limit. Throws no Json::Exception.
bool ParseJson(const std::string &text, Json::Value &value, bool collect_comments);

/// The value on one line without blanks. Bytes that are not UTF-8 are written as they are.
std::string CompactJson(const Json::Value &value);

/// The items as a JSON array, in order.
template <typename T>
Json::Value JsonArray(const std::vector<T> &items) {
  Json::Value array(Json::arrayValue);
  for (const T &item : items) array.append(item);
  return array;
}

}  // namespace VELK::sharing::internal

#endif
