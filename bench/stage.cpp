#include "stage.h"

#include <fcntl.h>
#include <unistd.h>
#include <velksharing/constants.h>

#include <filesystem>
#include <stdexcept>

#include "dataset.h"
#include "flush_counter.h"
#include "team.h"
#include "velk_paths.h"

namespace velk_bench {
namespace {

const std::string kFolder = VELK_BENCH_FOLDER;

void RemoveJournals(const std::string &database) {
  for (const char *suffix : {"-wal", "-shm"}) std::filesystem::remove(database + suffix);
}

void RemoveDatabase(const std::string &database) {
  std::filesystem::remove(database);
  RemoveJournals(database);
}

void FlushFile(const std::string &path) {
  const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  const bool flushed = file != -1 && fsync(file) == 0;
  close(file);
  if (!flushed) throw std::runtime_error("cannot flush " + path);
}

/// The file on the disk, and its name.
void FlushNew(const std::string &path) {
  FlushFile(path);
  FlushFile(std::filesystem::path(path).parent_path());
}

std::string Master(long links) {
  const std::string path = kFolder + "/sharing-" + std::to_string(links) + ".db";
  if (std::filesystem::exists(path)) return path;
  RunApart([&path, links] {
    MakeDatabase(path + ".new", links);
    std::filesystem::rename(path + ".new", path);
    return std::string();
  });
  return path;
}

}  // namespace

Stage::Stage() {
  if (LibraryDatabase().rfind(VELK_BINARY_DIR "/", 0) != 0)
    throw std::runtime_error(LibraryDatabase() + " is not this build's, and may be in use");
  std::filesystem::remove_all(kFolder);
  std::filesystem::create_directories(kFolder);
  RemoveDatabase(VELK_ROOT "/etc/private/autoblock.db");  // a login looks into it; there is none
  RequireFlushesAreCounted(kFolder.c_str());
}

Stage::~Stage() {
  std::error_code ignored;
  std::filesystem::remove_all(kFolder, ignored);
  for (const char *suffix : {"", "-wal", "-shm"})
    std::filesystem::remove(LibraryDatabase() + suffix, ignored);
}

void Stage::Set(long links) {
  const bool are_set = links_ == links;
  Spoil();  // unless all of this goes well
  const std::string master = Master(links);
  for (const std::string &database : {LibraryDatabase(), BaselineDatabase()}) {
    RemoveJournals(database);
    if (are_set) continue;
    RemoveDatabase(database);
    std::filesystem::copy_file(master, database);
    FlushNew(database);
  }
  links_ = links;
}

std::string LibraryDatabase() {
  return VELK::sharing::SZF_SHARING_DB_PATH;
}

std::string BaselineDatabase() {
  return kFolder + "/baseline.db";
}

}  // namespace velk_bench
