#ifndef BENCH_TEXT_TABLE_H
#define BENCH_TEXT_TABLE_H

#include <ostream>
#include <string>
#include <vector>

namespace velk_bench {

/// A table that reads well in a terminal and is Markdown, too. The first column stands to the left,
/// the others to the right.
class TextTable {
 public:
  explicit TextTable(std::vector<std::string> heads) : rows_{std::move(heads)} {}

  void Add(std::vector<std::string> cells) { rows_.push_back(std::move(cells)); }
  void Print(std::ostream &out) const;

 private:
  std::vector<std::vector<std::string>> rows_;
};

/// A number with as many digits as one reads: "12,345", "123", "12.3", "1.23".
std::string NumberText(double number);

/// Three places after the point: "0.987".
std::string RatioText(double ratio);

}  // namespace velk_bench

#endif
