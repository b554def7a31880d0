#ifndef BENCH_TEAM_H
#define BENCH_TEAM_H

#include <sys/types.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace velk_bench {

/// What one process of a team does. It lives in that process only.
class Member {
 public:
  Member() = default;
  Member(const Member &) = delete;
  Member &operator=(const Member &) = delete;
  virtual ~Member() = default;

  /// A part of the work.
  virtual void Turn() = 0;
  /// What the team's owner is to know of it.
  virtual std::string Report() = 0;
};

/// Forked processes that wait until it is their turn.
///
///     Team team(4, [](int number) { return std::make_unique<Worker>(number); });
///     for (int turn = 0; turn < 10; ++turn) team.Turn();
///     for (const std::string &report : team.Finish()) Read(report);
///
/// An operation throws when a process failed, with the text that was thrown there.
class Team {
 public:
  /// Returns when every process, numbered from 0, has made its member.
  Team(int count, const std::function<std::unique_ptr<Member>(int number)> &make);
  Team(const Team &) = delete;
  Team &operator=(const Team &) = delete;
  ~Team();

  /// All processes take a turn at the same time. Returns when the last is done.
  void Turn();

  /// Ends the processes.
  /// @return their reports, in order.
  std::vector<std::string> Finish();

 private:
  class Process;

  std::vector<std::unique_ptr<Process>> processes_;
};

/// Runs `body` in a process of its own, so that this one's memory stays small.
/// @return what `body` returned.
std::string RunApart(const std::function<std::string()> &body);

}  // namespace velk_bench

#endif
