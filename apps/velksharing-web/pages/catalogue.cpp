#include "pages/catalogue.h"

#include <json/reader.h>
#include <json/value.h>

#include <algorithm>
#include <array>
#include <memory>

namespace web {
namespace {

constexpr std::string_view kNoBreakSpace = "\xC2\xA0";

std::string Filled(std::string_view text, std::initializer_list<Catalogue::Place> places) {
  std::string filled;
  while (true) {
    const size_t open = text.find('{');
    const size_t close = text.find('}', std::min(open, text.size()));
    if (close == std::string_view::npos) return filled.append(text);
    const std::string_view name = text.substr(open + 1, close - open - 1);
    const auto place = std::find_if(places.begin(), places.end(),
                                    [name](const auto &known) { return known.first == name; });
    filled.append(text.substr(0, open));
    filled.append(place == places.end() ? text.substr(open, close - open + 1) : place->second);
    text.remove_prefix(close + 1);
  }
}

std::string TwoDigits(int number) {
  return {static_cast<char>('0' + number / 10 % 10), static_cast<char>('0' + number % 10)};
}

std::string OneLine(std::string text) {
  std::replace(text.begin(), text.end(), '\n', ' ');
  while (!text.empty() && text.back() == ' ') text.pop_back();
  return text;
}

}  // namespace

bool Catalogue::Read(std::string_view json, Texts &texts, std::string &error) {
  Json::CharReaderBuilder builder;
  Json::CharReaderBuilder::strictMode(&builder.settings_);
  builder["stackLimit"] = 8;
  const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
  Json::Value document;
  try {
    if (!reader->parse(json.data(), json.data() + json.size(), &document, &error)) {
      error = OneLine(error);
      return false;
    }
  } catch (const Json::Exception &exception) {
    error = OneLine(exception.what());
    return false;
  }
  if (!document.isObject()) {
    error = "not an object of texts";
    return false;
  }
  for (auto member = document.begin(); member != document.end(); ++member) {
    if (!member->isString()) {
      error = "\"" + member.name() + "\" is no text";
      return false;
    }
    texts.insert_or_assign(member.name(), member->asString());
  }
  return true;
}

Catalogue::Catalogue(Texts texts) : texts_(std::move(texts)) {}

std::string Catalogue::Text(std::string_view key) const {
  const auto found = texts_.find(key);
  if (found != texts_.end()) return found->second;
  return "\u00AB" + std::string(key) + "\u00BB";
}

std::string Catalogue::Text(std::string_view key, std::initializer_list<Place> places) const {
  return Filled(Text(key), places);
}

std::string Catalogue::Count(std::string_view key, uint64_t count) const {
  const std::string number = Number(count);
  return Text(std::string(key) + (count == 1 ? "_one" : "_other"), {{"count", number}});
}

std::string Catalogue::Number(uint64_t number) const {
  const std::string digits = std::to_string(number);
  const std::string separator = Text("format_thousands");
  std::string grouped;
  for (size_t i = 0; i < digits.size(); ++i) {
    if (i > 0 && (digits.size() - i) % 3 == 0) grouped += separator;
    grouped += digits[i];
  }
  return grouped;
}

std::string Catalogue::Size(uint64_t bytes) const {
  constexpr std::array kUnits = {"kB", "MB", "GB", "TB", "PB", "EB"};
  if (bytes < 1000) return Count("size_bytes", bytes);

  // Whole numbers only: rounding to what is shown must not leave "1000 kB".
  size_t unit = 0;
  uint64_t worth = 1000;
  while (unit + 1 < kUnits.size() && bytes >= worth * 1000 - worth / 2) {
    worth *= 1000;
    ++unit;
  }
  const uint64_t tenths = bytes / (worth / 10) + (bytes % (worth / 10) >= worth / 20 ? 1 : 0);
  std::string number;
  if (tenths < 100) {
    number = std::to_string(tenths / 10) + Text("format_decimal") + std::to_string(tenths % 10);
  } else {
    number = std::to_string(bytes / worth + (bytes % worth >= worth / 2 ? 1 : 0));
  }
  return number.append(kNoBreakSpace).append(kUnits[unit]);
}

std::string Catalogue::Time(time_t time) const {
  struct tm parts = {};
  if (localtime_r(&time, &parts) == nullptr) return "";
  const std::string month = TwoDigits(parts.tm_mon + 1);
  return Text("format_time", {{"d", std::to_string(parts.tm_mday)},
                              {"dd", TwoDigits(parts.tm_mday)},
                              {"mm", month},
                              {"month", Text("month_" + month)},
                              {"yyyy", std::to_string(parts.tm_year + 1900L)},
                              {"HH", TwoDigits(parts.tm_hour)},
                              {"MM", TwoDigits(parts.tm_min)}});
}

}  // namespace web
