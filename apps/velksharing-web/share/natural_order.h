#ifndef VELKSHARING_WEB_SHARE_NATURAL_ORDER_H
#define VELKSHARING_WEB_SHARE_NATURAL_ORDER_H

#include <string_view>

namespace web::share {

/// Compares names as people sort them: letters of ASCII without regard to case, runs of digits by
/// their value. Names that are alike in this way are ordered by their bytes.
/// @return less than, equal to, or greater than 0; equal only for the same bytes.
int CompareNaturally(std::string_view left, std::string_view right);

}  // namespace web::share

#endif
