#include "text_table.h"

#include <algorithm>
#include <cstdio>

namespace velk_bench {
namespace {

/// Characters, not bytes: each begins with a byte that does not continue one in UTF-8.
size_t Width(const std::string &text) {
  return static_cast<size_t>(
      std::count_if(text.begin(), text.end(), [](char byte) { return (byte & 0xC0) != 0x80; }));
}

void PrintRow(std::ostream &out, const std::vector<std::string> &cells,
              const std::vector<size_t> &widths) {
  for (size_t i = 0; i < cells.size(); ++i) {
    const std::string padding(widths[i] - Width(cells[i]), ' ');
    out << "| " << (i == 0 ? cells[i] + padding : padding + cells[i]) << ' ';
  }
  out << "|\n";
}

void PrintRule(std::ostream &out, const std::vector<size_t> &widths) {
  for (size_t i = 0; i < widths.size(); ++i)
    out << '|' << std::string(widths[i] + 1, '-') << (i == 0 ? '-' : ':');
  out << "|\n";
}

std::string Formatted(const char *format, double number) {
  char text[64];
  std::snprintf(text, sizeof text, format, number);
  return text;
}

std::string WithThousandsApart(std::string digits) {
  for (size_t place = digits.size(); place > 3;) {
    place -= 3;
    digits.insert(place, ",");
  }
  return digits;
}

}  // namespace

void TextTable::Print(std::ostream &out) const {
  std::vector<size_t> widths(rows_.front().size());
  for (const auto &row : rows_) {
    for (size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], Width(row[i]));
  }
  PrintRow(out, rows_.front(), widths);
  PrintRule(out, widths);
  for (size_t i = 1; i < rows_.size(); ++i) PrintRow(out, rows_[i], widths);
}

std::string NumberText(double number) {
  if (number == 0) return "0";
  if (number >= 99.95) return WithThousandsApart(Formatted("%.0f", number));
  return Formatted(number >= 9.995 ? "%.1f" : "%.2f", number);
}

std::string RatioText(double ratio) {
  return Formatted("%.3f", ratio);
}

}  // namespace velk_bench
