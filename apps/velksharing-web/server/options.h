#ifndef VELKSHARING_WEB_SERVER_OPTIONS_H
#define VELKSHARING_WEB_SERVER_OPTIONS_H

#include <optional>

#include "server/settings.h"

namespace web {

/// How the program is to run.
enum class Mode { EMBEDDED, FASTCGI };

struct Options {
  Settings settings;
  Mode mode = Mode::EMBEDDED;
  bool only_check = false;  ///< --check-config
};

/// Reads the command line, and the configuration that it names or leaves as it is.
/// @param[out] status what to exit with when nothing is returned: 0 after --help and --version, 2
///             after a mistake, which was printed.
std::optional<Options> ReadOptions(int argc, char **argv, int &status);

}  // namespace web

#endif
