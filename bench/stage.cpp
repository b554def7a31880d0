#include "stage.h"

#include <fcntl.h>
#include <unistd.h>
#include <velksharing/constants.h>

#include <filesystem>
#include <stdexcept>

#include "dataset.h"
#include "flush_counter.h"
#include "processes.h"

namespace velk_bench {
namespace {

const std::string kFolder = VELK_BENCH_FOLDER;

std::string SharingDatabase() {
  return VELK::sharing::SZF_SHARING_DB_PATH;
}

void RemoveJournals() {
  for (const char *suffix : {"-wal", "-shm"}) std::filesystem::remove(SharingDatabase() + suffix);
}

void RemoveSharingDatabase() {
  std::filesystem::remove(SharingDatabase());
  RemoveJournals();
}

/// A login looks into the file of blocked addresses; there is none.
void RemoveBlocks() {
  for (const char *suffix : {"", "-wal", "-shm"})
    std::filesystem::remove(std::string(VELK_ROOT "/etc/private/autoblock.db") + suffix);
}

void FlushFile(const std::string &path) {
  const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  const bool flushed = file != -1 && fsync(file) == 0;
  close(file);
  if (!flushed) throw std::runtime_error("cannot flush " + path);
}

std::string MasterCopy(long links) {
  const std::string path = kFolder + "/sharing-" + std::to_string(links) + ".db";
  if (std::filesystem::exists(path)) return path;
  RunApart([&path, links] {
    MakeDatabase(path + ".new", links);
    std::filesystem::rename(path + ".new", path);
  });
  return path;
}

}  // namespace

Stage::Stage() {
  if (SharingDatabase().rfind(VELK_BINARY_DIR "/", 0) != 0)
    throw std::runtime_error(SharingDatabase() + " is not this build's, and may be in use");
  std::filesystem::remove_all(kFolder);
  std::filesystem::create_directories(kFolder);
  RemoveBlocks();
  RequireFlushesAreCounted(kFolder.c_str());
}

Stage::~Stage() {
  std::error_code ignored;
  std::filesystem::remove_all(kFolder, ignored);
  for (const char *suffix : {"", "-wal", "-shm"})
    std::filesystem::remove(SharingDatabase() + suffix, ignored);
}

void Stage::Set(long links) {
  if (links_ == links) return RemoveJournals();
  const std::string master = MasterCopy(links);
  RemoveSharingDatabase();
  std::filesystem::copy_file(master, SharingDatabase());
  FlushFile(SharingDatabase());
  FlushFile(std::filesystem::path(SharingDatabase()).parent_path());
  links_ = links;
}

}  // namespace velk_bench
