#ifndef VELKSHARING_WEB_WATCH_LABELS_H
#define VELKSHARING_WEB_WATCH_LABELS_H

#include <array>
#include <chrono>
#include <cstddef>
#include <iterator>
#include <string>
#include <string_view>

#include "site/route_names.h"

/// What requests are counted by. All of it is known beforehand, so that the counters have fixed
/// places, and no visitor can make them more.

namespace web::watch {

inline constexpr size_t kRoutes = std::size(kRouteNames);

/// The last one stands for all others.
inline constexpr int kStatuses[] = {200, 204, 206, 303, 304, 400, 401, 403, 404, 405,
                                    408, 411, 412, 413, 414, 415, 416, 417, 421, 429,
                                    431, 500, 501, 502, 503, 505, 0,   -1};

/// The names of velksharing/access.h without their prefixes. The first one stands for a request
/// about which the library was not asked, the last one for all others.
inline constexpr std::string_view kResults[] = {"none",
                                                "OK",
                                                "ACCOUNT_REFUSED",
                                                "REFUSED",
                                                "UNUSABLE",
                                                "BLOCKED",
                                                "WRONG_PASSWORD",
                                                "NOT_PERMITTED",
                                                "USED_UP",
                                                "LAPSED",
                                                "NO_SESSION",
                                                "LINK_INVALID",
                                                "NO_GRANT",
                                                "FAILED",
                                                "other"};

/// Those of a refused login.
inline constexpr std::string_view kRefusals[] = {
    "ACCOUNT_REFUSED", "REFUSED",       "UNUSABLE", "BLOCKED",
    "WRONG_PASSWORD",  "NOT_PERMITTED", "USED_UP"};

/// Upper limits of the histogram of answer times, in microseconds; one place more has no limit.
inline constexpr std::array<std::chrono::microseconds::rep, 14> kBucketLimits = {
    500,     1'000,   2'500,   5'000,     10'000,    25'000,    50'000,
    100'000, 250'000, 500'000, 1'000'000, 2'500'000, 5'000'000, 10'000'000};

size_t RoutePlace(std::string_view route);
size_t StatusPlace(int status);
/// @param name as velksharing/access.h has it; "" for none.
size_t ResultPlace(std::string_view name);
size_t BucketPlace(std::chrono::microseconds time);

/// "200"; "none" where a connection broke before its answer; "other".
std::string StatusLabel(size_t place);

}  // namespace web::watch

#endif
