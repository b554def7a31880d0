#ifndef TESTS_SUPPORT_PROCESS_H
#define TESTS_SUPPORT_PROCESS_H

#include <functional>
#include <string>
#include <vector>

namespace velk_test {

/// How a program ended and what it printed.
struct Outcome {
  int status = -1;  ///< Exit status; 128 + the signal's number when a signal ended it.
  std::string out;  ///< Standard output.
  std::string err;  ///< Standard error.
};

/// Runs `arguments[0]` and waits for it.
/// @param input what it reads on standard input.
/// @param environment "NAME=value" texts added to this process's environment.
Outcome RunProgram(const std::vector<std::string> &arguments, const std::string &input = "",
                   const std::vector<std::string> &environment = {});

/// Runs `body` in a forked copy of this process and waits for it.
/// @return what `body` returned (0 to 255); 128 + the signal's number when a signal ended it.
int RunForked(const std::function<int()> &body);

/// Runs `body` in `count` forked copies of this process at the same time and waits for all.
/// @param body is handed its copy's number, from 0.
/// @return as RunForked(), for each copy in order.
std::vector<int> RunForkedTogether(int count, const std::function<int(int)> &body);

}  // namespace velk_test

#endif
