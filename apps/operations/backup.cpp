#include <fcntl.h>
#include <sqlite3.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <memory>

#include "operations/maintenance.h"
#include "velk/velkdb.h"
#include "velksharing/constants.h"

namespace operations {
namespace {

using VELK::sharing::SZF_SHARING_DB_PATH;

using Source = std::unique_ptr<VELKDBHandle, void (*)(VELKDBHandle *)>;
using Connection = std::unique_ptr<sqlite3, int (*)(sqlite3 *)>;

/// The file while it grows: a name of its own beside the target, removed unless published.
class UnfinishedFile {
 public:
  explicit UnfinishedFile(const std::string &target) : target_(target), path_(target + ".XXXXXX") {
    file_ = mkostemp(path_.data(), O_CLOEXEC);
    if (file_ < 0) throw SystemFailure("no file could be made beside " + target_);
  }
  UnfinishedFile(const UnfinishedFile &) = delete;
  UnfinishedFile &operator=(const UnfinishedFile &) = delete;
  ~UnfinishedFile() {
    for (const char *suffix : {"-journal", "-wal", "-shm"}) unlink((path_ + suffix).c_str());
    if (!published_) unlink(path_.c_str());
    close(file_);
  }

  const std::string &path() const { return path_; }

  /// Flushes it and gives it the target's name.
  void Publish() {
    if (fsync(file_) != 0) throw SystemFailure(path_ + " could not be flushed");
    Rename();
    published_ = true;
    FlushFolder();
  }

 private:
  void Rename() const {
    if (renameat2(AT_FDCWD, path_.c_str(), AT_FDCWD, target_.c_str(), RENAME_NOREPLACE) == 0)
      return;
    // Some file systems cannot rename without replacing, but all those can link.
    if (errno == EINVAL && link(path_.c_str(), target_.c_str()) == 0) {
      unlink(path_.c_str());
      return;
    }
    if (errno == EEXIST) throw Failure(Failure::REFUSED, target_ + " exists");
    throw SystemFailure(target_ + " could not be made");
  }

  void FlushFolder() const {
    std::string folder = std::filesystem::path(target_).parent_path();
    if (folder.empty()) folder = ".";
    const int file = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (file < 0) return;
    fsync(file);
    close(file);
  }

  const std::string target_;
  std::string path_;
  int file_ = -1;
  bool published_ = false;
};

Source OpenSource() {
  Source source(VELKDBConnect("", "", "", SZF_SHARING_DB_PATH), VELKDBClose);
  if (!source) throw DatabaseUnusable();
  return source;
}

Connection OpenTarget(const std::string &path) {
  sqlite3 *opened = nullptr;
  const int code =
      sqlite3_open_v2(path.c_str(), &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOFOLLOW, nullptr);
  Connection target(opened, sqlite3_close);
  if (code != SQLITE_OK) throw Failure(Failure::DATABASE, path + ": " + sqlite3_errstr(code));
  return target;
}

/// All pages in one step: one read transaction, which holds up no writer in WAL mode and is not
/// started over when somebody writes.
void Copy(sqlite3 *source, sqlite3 *target) {
  sqlite3_backup *backup = sqlite3_backup_init(target, "main", source, "main");
  int code = backup == nullptr ? sqlite3_errcode(target) : sqlite3_backup_step(backup, -1);
  if (backup != nullptr) sqlite3_backup_finish(backup);
  if (code == SQLITE_DONE) return;
  if (code == SQLITE_FULL || code == SQLITE_IOERR || code == SQLITE_CANTOPEN) {
    throw Failure(Failure::SYSTEM,
                  std::string("the copy could not be written: ") + sqlite3_errstr(code));
  }
  throw Failure(Failure::DATABASE,
                std::string("the database could not be copied: ") + sqlite3_errstr(code));
}

void RefuseExisting(const std::string &target) {
  struct stat info = {};
  if (lstat(target.c_str(), &info) == 0) throw Failure(Failure::REFUSED, target + " exists");
}

}  // namespace

void BackUp(const std::string &target) {
  if (target.empty()) throw Failure(Failure::INVALID, "the file's name is empty");
  RefuseExisting(target);
  const Source source = OpenSource();
  UnfinishedFile file(std::filesystem::absolute(target));
  Copy(VELKDBSqlite(source.get()), OpenTarget(file.path()).get());
  file.Publish();
}

}  // namespace operations
