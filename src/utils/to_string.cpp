#include <type_traits>

#include "velksharing/utils.h"

namespace VELK::sharing {

template <typename T>
std::string ToString(T &value) {
  if constexpr (std::is_convertible_v<T, std::string>) {
    return value;
  } else {
    return std::to_string(value);  // true and false count as 1 and 0
  }
}

template VELK_EXPORT std::string ToString<std::string>(std::string &value);
template VELK_EXPORT std::string ToString<bool>(bool &value);
template VELK_EXPORT std::string ToString<const bool>(const bool &value);
template VELK_EXPORT std::string ToString<int>(int &value);
template VELK_EXPORT std::string ToString<const int>(const int &value);
template VELK_EXPORT std::string ToString<const long>(const long &value);

}  // namespace VELK::sharing
