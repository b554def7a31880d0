#include "settings.h"

#include <algorithm>
#include <string_view>

#include "common/config_file.h"
#include "host.h"
#include "mistake.h"
#include "public_url.h"
#include "velk_paths.h"

namespace sharing_url {
namespace {

using velk::ConfigMistake;

constexpr char kPath[] = VELK_ROOT "/etc/sharing-url.conf";

void SetHost(std::string_view value, Settings &settings) {
  settings.external_host = HostForUrl(std::string(value));
}

void SetPort(std::string_view value, Settings &settings) {
  settings.external_port = static_cast<int>(velk::ConfigNumber(value, 1, 65535));
}

void SetHttps(std::string_view value, Settings &settings) {
  const bool yes = value == "yes" || value == "true" || value == "1";
  const bool no = value == "no" || value == "false" || value == "0";
  if (!yes && !no) throw ConfigMistake("not yes or no");
  settings.https = yes;
}

void SetPath(std::string_view value, Settings &settings) {
  settings.path = PathForUrl(std::string(value));
}

/// One key and what takes its value.
struct Setting {
  std::string_view key;
  void (*set)(std::string_view value, Settings &settings);
};

constexpr Setting kSettings[] = {
    {"external_host", SetHost},
    {"external_port", SetPort},
    {"https", SetHttps},
    {"path", SetPath},
};

/// A key for a message: nothing in it can drive a terminal.
std::string Printable(std::string_view key) {
  std::string text(key);
  std::replace_if(
      text.begin(), text.end(), [](char byte) { return byte < ' ' || byte > '~'; }, '?');
  return text;
}

void Set(std::string_view key, std::string_view value, Settings &settings) {
  const auto *setting = std::find_if(std::begin(kSettings), std::end(kSettings),
                                     [&](const Setting &known) { return known.key == key; });
  if (setting == std::end(kSettings)) throw ConfigMistake("unknown key “" + Printable(key) + "”");
  try {
    if (value.empty()) throw ConfigMistake("no value; leave the line out where none is meant");
    setting->set(value, settings);
  } catch (const std::runtime_error &mistake) {
    throw ConfigMistake(std::string(key) + ": " + mistake.what());
  }
}

}  // namespace

Settings ReadSettings() {
  Settings settings;
  try {
    velk::ReadConfigFile(
        kPath, [&](std::string_view key, std::string_view value) { Set(key, value, settings); });
  } catch (const ConfigMistake &mistake) {
    throw Mistake(mistake.what());
  }
  return settings;
}

}  // namespace sharing_url
