#ifndef VELKSHARING_WEB_HTTP_QUALITY_H
#define VELKSHARING_WEB_HTTP_QUALITY_H

#include <string_view>

namespace web {

/// How much a visitor wants one of the things that a field like Accept lists, in thousandths.
/// @param parameters what stands behind the thing's first semicolon: "level=1;q=0.8".
/// @return 0, not at all, to 1000; 1000 where no quality is given, 0 for one that is no number from
///         0 to 1 with three decimals at most.
int QualityOf(std::string_view parameters);

}  // namespace web

#endif
