// Fills the sharing database of this build with links, so that looking one up is real work.
//
//   velksharing_bench_links COUNT      prints the file's name

#include <velksharing/constants.h>

#include <cstdlib>
#include <exception>
#include <filesystem>
#include <iostream>
#include <stdexcept>
#include <string>

#include "dataset.h"

namespace {

/// Nothing but the build's own database may be replaced.
void RequireOwnDatabase(const std::string &database) {
  if (database.rfind(VELK_BINARY_DIR "/", 0) != 0)
    throw std::runtime_error(database + " is not this build's, and may be in use");
}

void Replace(const std::string &database, long links) {
  RequireOwnDatabase(database);
  for (const char *suffix : {"", "-wal", "-shm"}) std::filesystem::remove(database + suffix);
  velk_bench::MakeDatabase(database, links);
}

}  // namespace

int main(int argc, char **argv) {
  const long links = argc == 2 ? std::atol(argv[1]) : 0;
  if (links <= 0) {
    std::cerr << "usage: velksharing_bench_links COUNT\n";
    return 2;
  }
  try {
    Replace(VELK::sharing::SZF_SHARING_DB_PATH, links);
    std::cout << VELK::sharing::SZF_SHARING_DB_PATH << '\n';
    return 0;
  } catch (const std::exception &error) {
    std::cerr << "velksharing_bench_links: " << error.what() << '\n';
    return 1;
  }
}
