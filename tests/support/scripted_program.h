#ifndef TESTS_SUPPORT_SCRIPTED_PROGRAM_H
#define TESTS_SUPPORT_SCRIPTED_PROGRAM_H

#include <string>
#include <vector>

#include "support/temp_dir.h"

namespace velk_test {

/// A shell script that is run in place of whatever program the library starts while this lives.
/// Everything else is real: the child, the pipe, the waiting. One at a time.
///
///     const ScriptedProgram program("echo https://example.org/; echo 2");
///
/// A program that uses this class replaces VLIBCPopenv() for every library that it loads, and
/// links one that needs velkcore.
class ScriptedProgram {
 public:
  /// What the library asked for.
  struct Call {
    std::string path;
    std::string mode;
    std::vector<std::string> arguments;  ///< The program's name first.
  };

  /// @param script commands for /bin/sh. They find the arguments in $1, $2 … and this script's
  ///        own, otherwise empty folder in $FOLDER.
  explicit ScriptedProgram(const std::string &script);
  ScriptedProgram(const ScriptedProgram &) = delete;
  ScriptedProgram &operator=(const ScriptedProgram &) = delete;
  ~ScriptedProgram();

  /// The script.
  std::string path() const { return folder_.File("program"); }
  /// A file in the script's folder.
  std::string File(const std::string &name) const { return folder_.File(name); }
  /// Every start that was asked for, in order.
  const std::vector<Call> &calls() const { return calls_; }
  void Add(Call call) { calls_.push_back(std::move(call)); }

 private:
  const TempDir folder_;
  std::vector<Call> calls_;
};

}  // namespace velk_test

#endif
