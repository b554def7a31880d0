#include "common/config_file.h"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <fstream>
#include <set>
#include <system_error>

#include "common/text.h"

namespace velk {
namespace {

constexpr std::string_view kBlanks = " \t\r";

struct Setting {
  std::string_view key;
  std::string_view value;
};

Setting Split(std::string_view line) {
  const size_t sign = line.find('=');
  if (sign == std::string_view::npos) throw ConfigMistake("not of the form \"key = value\"");
  return {Trim(line.substr(0, sign), kBlanks), Trim(line.substr(sign + 1), kBlanks)};
}

}  // namespace

void ReadConfigFile(
    const std::string &path,
    const std::function<void(std::string_view key, std::string_view value)> &setting,
    std::initializer_list<std::string_view> repeatable) {
  errno = 0;
  std::ifstream file(path);
  if (!file && errno == ENOENT) return;

  std::set<std::string, std::less<>> seen;
  std::string text;
  for (int number = 1; std::getline(file, text); ++number) {
    const std::string_view line = Trim(std::string_view(text).substr(0, text.find('#')), kBlanks);
    if (line.empty()) continue;
    try {
      const auto [key, value] = Split(line);
      const bool is_new = seen.emplace(key).second;
      if (!is_new && std::find(repeatable.begin(), repeatable.end(), key) == repeatable.end())
        throw ConfigMistake("key given twice");
      setting(key, value);
    } catch (const ConfigMistake &mistake) {
      throw ConfigMistake(path + ":" + std::to_string(number) + ": " + mistake.what());
    }
  }
  if (!file.eof())
    throw ConfigMistake("cannot read " + path + ": " + std::generic_category().message(errno));
}

long ConfigNumber(std::string_view value, long lowest, long highest) {
  long number = 0;
  const auto [end, error] = std::from_chars(value.data(), value.data() + value.size(), number);
  if (error == std::errc::invalid_argument || end != value.data() + value.size())
    throw ConfigMistake("not a whole number");
  if (error != std::errc() || number < lowest || number > highest) {
    throw ConfigMistake("not from " + std::to_string(lowest) + " to " + std::to_string(highest));
  }
  return number;
}

}  // namespace velk
