#ifndef TESTS_FUZZ_PLAYED_PROGRAM_H
#define TESTS_FUZZ_PLAYED_PROGRAM_H

#include <string>

namespace velk_test {

/// From now on, what every program prints that the library starts: a target that contains
/// played_program.cpp starts none and reads this. Nothing is logged there, either.
void PlayProgram(const std::string &output);

}  // namespace velk_test

#endif
