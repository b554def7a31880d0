#ifndef VELKSHARING_WEB_HTTP_FIELDS_H
#define VELKSHARING_WEB_HTTP_FIELDS_H

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace web {

/// Header fields in the order in which they came. Upper and lower case of names are alike.
class Fields {
 public:
  using Field = std::pair<std::string, std::string>;  ///< Name and value.

  /// Adds a field behind those that are there, of the same name or not.
  void Add(std::string name, std::string value);
  /// Puts a field in the place of all of its name.
  void Set(std::string_view name, std::string value);

  /// The first value of a name; null when there is none. Valid until the next change.
  const std::string *Find(std::string_view name) const;
  /// The first value of a name; "" when there is none.
  std::string_view Get(std::string_view name) const;
  /// How many fields have this name.
  size_t Count(std::string_view name) const;

  std::vector<Field>::const_iterator begin() const { return fields_.begin(); }
  std::vector<Field>::const_iterator end() const { return fields_.end(); }

 private:
  std::vector<Field> fields_;
};

}  // namespace web

#endif
