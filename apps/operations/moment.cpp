#include "operations/moment.h"

#include <ctime>

namespace operations {

long Now() {
  return static_cast<long>(time(nullptr));
}

std::string MomentText(long seconds) {
  if (seconds <= 0) return "";
  const time_t moment = seconds;
  struct tm parts = {};
  char text[64];
  if (localtime_r(&moment, &parts) == nullptr ||
      strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S", &parts) == 0) {
    return "@" + std::to_string(seconds);
  }
  return text;
}

}  // namespace operations
