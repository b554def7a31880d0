#include "share/item.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace web::share {

std::optional<std::string> ReadStart(const Item &file, size_t limit) {
  std::string start(std::min(limit, static_cast<size_t>(file.size)), '\0');
  size_t filled = 0;
  while (filled < start.size()) {
    const ssize_t count = pread(file.file.get(), start.data() + filled, start.size() - filled,
                                static_cast<off_t>(filled));
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return std::nullopt;
    if (count == 0) break;
    filled += static_cast<size_t>(count);
  }
  start.resize(filled);
  return start;
}

}  // namespace web::share
