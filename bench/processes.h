#ifndef BENCH_PROCESSES_H
#define BENCH_PROCESSES_H

#include <functional>
#include <string>
#include <vector>

namespace velk_bench {

/// What a process does: gets ready; calls `wait` once, which returns when all processes are ready;
/// does its work; returns what its parent is to know. Throwing ends the process.
using ProcessBody = std::function<std::string(int number, const std::function<void()> &wait)>;

/// Runs `body` in `count` forked processes, numbered from 0, at the same time.
/// @return what each returned, in order. Throws when one of them failed, with its reason.
std::vector<std::string> RunTogether(int count, const ProcessBody &body);

/// Runs `body` in a forked process, so that this one's memory stays as it is. Throws as above.
void RunApart(const std::function<void()> &body);

}  // namespace velk_bench

#endif
