#include "server/options.h"

#include <CLI/CLI.hpp>
#include <iostream>

#include "common/config_file.h"
#include "server/sockets.h"

namespace web {
namespace {

constexpr int kUsageMistake = 2;

/// The command line as it was typed.
struct Typed {
  std::string config = kConfigPath;
  std::string listen;
  std::string fastcgi;
  std::string workers;
  std::string access_log;
  std::vector<std::string> settings;  ///< "key=value"
  bool has_fastcgi = false;
  bool only_check = false;
};

void Describe(CLI::App &app, Typed &typed) {
  app.set_version_flag("--version", "velksharing-web " VELKSHARING_VERSION);
  app.add_option("--listen", typed.listen,
                 "Serve HTTP here: ADDRESS:PORT, [ADDRESS]:PORT or the path of a socket")
      ->type_name("ADDRESS");
  app.add_option("--fastcgi", typed.fastcgi,
                 "Serve FastCGI on this socket; without it, on the one that was handed over")
      ->type_name("SOCKET")
      ->expected(0, 1);
  app.add_option("--workers", typed.workers, "How many processes serve")->type_name("N");
  app.add_option("--access-log", typed.access_log, "off, stderr, syslog or a file")
      ->type_name("TARGET");
  app.add_option("--config", typed.config, "Read this file in place of " + typed.config)
      ->type_name("FILE");
  app.add_option("--set", typed.settings, "One setting, in place of the configuration's")
      ->type_name("KEY=VALUE")
      ->take_all();
  app.add_flag("--check-config", typed.only_check, "Check the configuration and exit");
  app.footer(
      "Without --listen and --fastcgi the configuration decides, and without it\n"
      "HTTP is served on 127.0.0.1:8080. See velksharing-web(8).");
}

void ApplyTyped(const Typed &typed, Settings &settings) {
  if (!typed.listen.empty()) {
    settings.fastcgi.clear();
    Apply("listen", typed.listen, settings);
  }
  if (typed.has_fastcgi) settings.listen.clear();
  if (!typed.fastcgi.empty()) Apply("fastcgi", typed.fastcgi, settings);
  if (!typed.workers.empty()) Apply("workers", typed.workers, settings);
  if (!typed.access_log.empty()) Apply("access_log", typed.access_log, settings);
  for (const std::string &setting : typed.settings) {
    const size_t sign = setting.find('=');
    if (sign == std::string::npos) throw velk::ConfigMistake("--set: not of the form key=value");
    Apply(setting.substr(0, sign), setting.substr(sign + 1), settings);
  }
}

/// A process that was started with a listening socket as its standard input serves FastCGI on it.
Mode ModeOf(const Typed &typed, const Settings &settings) {
  if (typed.has_fastcgi || !settings.fastcgi.empty()) return Mode::FASTCGI;
  if (settings.listen.empty() && IsListening(STDIN_FILENO)) return Mode::FASTCGI;
  return Mode::EMBEDDED;
}

}  // namespace

std::optional<Options> ReadOptions(int argc, char **argv, int &status) {
  CLI::App app("The visitors' side of sharing links: a web page in front of every link.",
               "velksharing-web");
  Typed typed;
  Describe(app, typed);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError &error) {
    status = app.exit(error) == 0 ? 0 : kUsageMistake;
    return std::nullopt;
  }
  typed.has_fastcgi = app.count("--fastcgi") > 0;
  try {
    Options options;
    options.settings = ReadSettings(typed.config);
    ApplyTyped(typed, options.settings);
    CheckTogether(options.settings);
    options.mode = ModeOf(typed, options.settings);
    options.only_check = typed.only_check;
    return options;
  } catch (const velk::ConfigMistake &mistake) {
    std::cerr << "velksharing-web: " << mistake.what() << '\n';
    status = kUsageMistake;
    return std::nullopt;
  }
}

}  // namespace web
