#ifndef VELKSHARING_CLI_OUTPUT_H
#define VELKSHARING_CLI_OUTPUT_H

#include <json/value.h>

#include <string>
#include <utility>
#include <vector>

#include "operations/database.h"

/// What the program prints. Texts from the database or from outside pass through SafeText() on
/// their way to a terminal; main() sets the UTF-8 character type that this needs.

namespace command_line {

/// The text with every control character, every character that changes the writing direction and
/// every byte that is not UTF-8 replaced by U+FFFD, so that it cannot drive a terminal.
std::string SafeText(const std::string &text);

/// Columns that a safe text takes on a terminal.
std::size_t DisplayWidth(const std::string &text);

/// Rows under headings, aligned.
class Table {
 public:
  explicit Table(std::vector<std::string> headings);

  /// @param cells as many as there are headings.
  void AddRow(std::vector<std::string> cells);
  void Print() const;

 private:
  std::vector<std::vector<std::string>> rows_;
};

/// Names and values, one pair in each line.
void PrintDetails(const std::vector<std::pair<std::string, std::string>> &details);

void PrintLine(const std::string &text);
void PrintJson(const Json::Value &json);

/// "velksharing: …" on standard error.
void PrintError(const std::string &message);

/// What a purge has removed; `noun` names one row.
void PrintRemoval(const operations::Removal &removal, const std::string &noun, bool json);

/// "3 links", "1 link".
std::string Counted(int count, const std::string &noun);

}  // namespace command_line

#endif
