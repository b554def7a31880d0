#ifndef TESTS_INTEGRATION_CLI_SUPPORT_H
#define TESTS_INTEGRATION_CLI_SUPPORT_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>

#include <string>
#include <vector>

#include "support/process.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "support/velk_root.h"

namespace velk_test {

/// The administrator's command line from end to end, each test on a database of its own.
class CommandLine : public testing::Test {
 protected:
  using Arguments = std::vector<std::string>;

  void SetUp() override;
  void TearDown() override;

  /// Runs velksharing with these arguments.
  static Outcome Run(const Arguments &arguments, const std::string &input = "",
                     const std::vector<std::string> &environment = {});

  /// Runs it with --json, which must work, and gives what it prints.
  static Json::Value RunJson(Arguments arguments, const std::string &input = "");

  /// Makes a link with these options beside its project, "files".
  /// @return its hash.
  static std::string MakeLink(const Arguments &options = {}, const std::string &input = "");

  /// Logs a visitor in, which must work.
  /// @return the session's identifier.
  static std::string LogIn(const std::string &hash, const Arguments &options = {},
                           const std::string &input = "");

  /// The member "state" of a link.
  static std::string StateOf(const std::string &hash);

  /// Damages the stored data of a link.
  static void Damage(const std::string &hash);
};

/// Runs velksharing on a terminal of its own, and types one of `answers` behind each question.
/// @return its status; `out` is what the terminal shows.
Outcome RunOnTerminal(const std::vector<std::string> &arguments,
                      const std::vector<std::string> &answers);

}  // namespace velk_test

#endif
