#ifndef VELKCGI_REQUEST_H
#define VELKCGI_REQUEST_H

#include <cstddef>
#include <string_view>

namespace velk {

/// The largest request body that is looked at.
constexpr size_t kLargestBody = 1 << 20;

/// A variable of the request that the calling thread serves, as it stands now; null when it has
/// none of that name.
const char *RequestVariable(const char *name);

/// The body of that request; empty when there is none, when it is larger than kLargestBody or when
/// it was cut short. Valid until the request ends.
std::string_view RequestBody();

}  // namespace velk

#endif
