#include "flush_counter.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

#include "sqlite.h"

namespace {

long flushes = 0;  // the workers have one thread each

}  // namespace

extern "C" {

__attribute__((visibility("default"))) int fsync(int file) {
  ++flushes;
  return static_cast<int>(syscall(SYS_fsync, file));
}

__attribute__((visibility("default"))) int fdatasync(int file) {
  ++flushes;
  return static_cast<int>(syscall(SYS_fdatasync, file));
}
}

namespace velk_bench {

long FlushesSoFar() {
  return flushes;
}

void RequireFlushesAreCounted(const char *folder) {
  const std::string path = std::string(folder) + "/flushed.db";
  std::ofstream(path).close();
  const long before = FlushesSoFar();
  {
    Connection connection(path);
    connection.Run("CREATE TABLE flushed (a)");
  }
  std::filesystem::remove(path);
  if (FlushesSoFar() == before)
    throw std::runtime_error("SQLite's flushes do not pass this program; they cannot be counted");
}

}  // namespace velk_bench
