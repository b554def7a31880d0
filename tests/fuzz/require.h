#ifndef TESTS_FUZZ_REQUIRE_H
#define TESTS_FUZZ_REQUIRE_H

#include <cstdlib>

namespace velk_test {

/// Ends the program where something does not hold: the fuzzer then keeps the input.
inline void Require(bool holds) {
  if (!holds) abort();
}

}  // namespace velk_test

#endif
