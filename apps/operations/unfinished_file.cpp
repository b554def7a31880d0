#include "operations/unfinished_file.h"

#include <fcntl.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>

#include "operations/failure.h"

namespace operations {
namespace {

std::string NewTarget(const std::string &target) {
  if (target.empty()) throw Failure(Failure::INVALID, "the file's name is empty");
  struct stat info = {};
  if (lstat(target.c_str(), &info) == 0) throw Failure(Failure::REFUSED, target + " exists");
  return std::filesystem::absolute(target);
}

}  // namespace

UnfinishedFile::UnfinishedFile(const std::string &target)
    : target_(NewTarget(target)), path_(target_ + ".XXXXXX") {
  file_ = mkostemp(path_.data(), O_CLOEXEC);
  if (file_ < 0) throw SystemFailure("no file could be made beside " + target_);
}

UnfinishedFile::~UnfinishedFile() {
  for (const char *suffix : {"-journal", "-wal", "-shm"}) unlink((path_ + suffix).c_str());
  if (!published_) unlink(path_.c_str());
  close(file_);
}

void UnfinishedFile::Write(const std::string &text) {
  for (std::size_t written = 0; written < text.size();) {
    const ssize_t count = write(file_, text.data() + written, text.size() - written);
    if (count < 0 && errno != EINTR) throw SystemFailure(target_ + " could not be written");
    if (count > 0) written += static_cast<std::size_t>(count);
  }
}

void UnfinishedFile::Publish() {
  if (fsync(file_) != 0) throw SystemFailure(path_ + " could not be flushed");
  Rename();
  published_ = true;
  FlushFolder();
}

void UnfinishedFile::Rename() const {
  if (renameat2(AT_FDCWD, path_.c_str(), AT_FDCWD, target_.c_str(), RENAME_NOREPLACE) == 0) return;
  // Some file systems cannot rename without replacing, but all those can link.
  if (errno == EINVAL && link(path_.c_str(), target_.c_str()) == 0) {
    unlink(path_.c_str());
    return;
  }
  if (errno == EEXIST) throw Failure(Failure::REFUSED, target_ + " exists");
  throw SystemFailure(target_ + " could not be made");
}

void UnfinishedFile::FlushFolder() const {
  std::string folder = std::filesystem::path(target_).parent_path();
  if (folder.empty()) folder = ".";
  const int file = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (file < 0) return;
  fsync(file);
  close(file);
}

}  // namespace operations
