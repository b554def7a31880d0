#ifndef COMMON_NO_THROW_H
#define COMMON_NO_THROW_H

namespace velk {

/// What `body` returns, or `failure` when it throws: no exception may cross a C interface.
template <typename Answer, typename Body>
Answer NoThrow(Answer failure, const Body &body) noexcept {
  try {
    return body();
  } catch (...) {
    return failure;
  }
}

}  // namespace velk

#endif
