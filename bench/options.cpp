#include "options.h"

#include <cstdlib>
#include <stdexcept>
#include <string_view>

namespace velk_bench {
namespace {

constexpr std::string_view kSeconds = "--seconds=";
constexpr double kLongestSeconds = 3600;

double SecondsOf(std::string_view argument) {
  const std::string text(argument.substr(kSeconds.size()));
  char *end = nullptr;
  const double seconds = std::strtod(text.c_str(), &end);
  if (end == text.c_str() || *end != '\0' || !(seconds > 0 && seconds <= kLongestSeconds))
    throw std::invalid_argument("--seconds takes a number above 0, up to 3600");
  return seconds;
}

bool Take(std::string_view argument, Options &options) {
  if (argument == "--large") {
    options.link_counts.push_back(1000000);
  } else if (argument == "--quick") {
    options.link_counts = {1000};
    options.seconds = 0.1;
    options.others.emplace_back("--benchmark_repetitions=1");
  } else if (argument.substr(0, kSeconds.size()) == kSeconds) {
    options.seconds = SecondsOf(argument);
  } else {
    return false;
  }
  return true;
}

}  // namespace

Options TakeOptions(int argc, char **argv) {
  Options options;
  // Rounds of all cases mixed: what slows the machine down for a while does not hit one case alone.
  options.others = {argv[0], "--benchmark_repetitions=5",
                    "--benchmark_enable_random_interleaving=true"};
  for (int i = 1; i < argc; ++i) {
    if (!Take(argv[i], options)) options.others.emplace_back(argv[i]);
  }
  return options;
}

}  // namespace velk_bench
