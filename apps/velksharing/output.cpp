#include "output.h"

#include <json/writer.h>
#include <wchar.h>

#include <algorithm>
#include <iostream>

#include "operations/json_form.h"

namespace command_line {
namespace {

constexpr char kReplacement[] = "\uFFFD";

/// Marks that make a terminal show text in another order than it is stored.
bool ChangesDirection(wchar_t character) {
  return character == 0x061C || character == 0x200E || character == 0x200F ||
         (character >= 0x202A && character <= 0x202E) ||
         (character >= 0x2066 && character <= 0x2069);
}

struct Character {
  std::size_t bytes = 1;
  int width = -1;  ///< Columns; less than 0 when it must not be printed.
};

Character NextCharacter(const char *text, std::size_t length) {
  mbstate_t state = {};
  wchar_t character = 0;
  const std::size_t bytes = mbrtowc(&character, text, length, &state);
  if (bytes == 0 || bytes > length) return {};
  return {bytes, ChangesDirection(character) ? -1 : wcwidth(character)};
}

std::string Padded(const std::string &text, std::size_t width) {
  return text + std::string(width - DisplayWidth(text), ' ');
}

std::vector<std::size_t> ColumnWidths(const std::vector<std::vector<std::string>> &rows) {
  std::vector<std::size_t> widths(rows.front().size());
  for (const auto &row : rows) {
    for (std::size_t i = 0; i < row.size(); ++i)
      widths[i] = std::max(widths[i], DisplayWidth(row[i]));
  }
  return widths;
}

}  // namespace

std::string SafeText(const std::string &text) {
  std::string safe;
  for (std::size_t i = 0; i < text.size();) {
    const Character next = NextCharacter(text.data() + i, text.size() - i);
    if (next.width < 0)
      safe += kReplacement;
    else
      safe.append(text, i, next.bytes);
    i += next.bytes;
  }
  return safe;
}

std::size_t DisplayWidth(const std::string &text) {
  std::size_t width = 0;
  for (std::size_t i = 0; i < text.size();) {
    const Character next = NextCharacter(text.data() + i, text.size() - i);
    width += static_cast<std::size_t>(std::max(next.width, 0));
    i += next.bytes;
  }
  return width;
}

Table::Table(std::vector<std::string> headings) {
  rows_.push_back(std::move(headings));
}

void Table::AddRow(std::vector<std::string> cells) {
  for (std::string &cell : cells) cell = SafeText(cell);
  rows_.push_back(std::move(cells));
}

void Table::Print() const {
  const std::vector<std::size_t> widths = ColumnWidths(rows_);
  for (const auto &row : rows_) {
    std::string line;
    for (std::size_t i = 0; i < row.size(); ++i) line += Padded(row[i], widths[i]) + "  ";
    line.erase(line.find_last_not_of(' ') + 1);
    std::cout << line << '\n';
  }
}

void PrintDetails(const std::vector<std::pair<std::string, std::string>> &details) {
  std::size_t width = 0;
  for (const auto &[name, value] : details) width = std::max(width, DisplayWidth(name));
  for (const auto &[name, value] : details)
    std::cout << Padded(name, width) << "  " << SafeText(value) << '\n';
}

void PrintLine(const std::string &text) {
  std::cout << SafeText(text) << '\n';
}

void PrintJson(const Json::Value &json) {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "  ";
  std::cout << Json::writeString(builder, json) << '\n';
}

void PrintError(const std::string &message) {
  std::cout.flush();
  std::cerr << "velksharing: " << SafeText(message) << '\n';
}

void PrintRemoval(const operations::Removal &removal, const std::string &noun, bool json) {
  if (json) return PrintJson(operations::ToJson(removal));
  PrintLine("removed " + Counted(removal.removed, noun) + " of " +
            std::to_string(removal.removed + removal.remaining) + "; " +
            std::to_string(removal.remaining) + " left");
}

std::string Counted(int count, const std::string &noun) {
  return std::to_string(count) + " " + noun + (count == 1 ? "" : "s");
}

}  // namespace command_line
