#include <algorithm>
#include <climits>
#include <cstring>

#include "velk/velkdb.h"

namespace {

/// Copies in runs up to and with each quote; the second quote comes behind a run.
char *CopyWithQuotesDoubled(char *out, const char *in, const char *end) {
  while (in != end) {
    const auto *quote =
        static_cast<const char *>(std::memchr(in, '\'', static_cast<size_t>(end - in)));
    const char *run_end = quote == nullptr ? end : quote + 1;
    out = std::copy(in, run_end, out);
    if (quote != nullptr) *out++ = '\'';
    in = run_end;
  }
  return out;
}

}  // namespace

int VELKDBEscapeStringEX2(int /*engine*/, char *out, size_t capacity, const char *in,
                          size_t length) {
  if (length > INT_MAX) return -1;
  if (length > 0 && (out == nullptr || in == nullptr)) return -1;
  const char *end = length == 0 ? in : in + length;
  const size_t needed = length + static_cast<size_t>(std::count(in, end, '\''));
  if (needed > INT_MAX || needed > capacity) return -1;
  char *out_end = CopyWithQuotesDoubled(out, in, end);
  if (out != nullptr && needed < capacity) *out_end = '\0';
  return static_cast<int>(needed);
}
