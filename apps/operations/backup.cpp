#include <sqlite3.h>

#include <memory>

#include "operations/maintenance.h"
#include "operations/unfinished_file.h"
#include "velk/velkdb.h"
#include "velksharing/constants.h"

namespace operations {
namespace {

using VELK::sharing::SZF_SHARING_DB_PATH;

using Source = std::unique_ptr<VELKDBHandle, void (*)(VELKDBHandle *)>;
using Connection = std::unique_ptr<sqlite3, int (*)(sqlite3 *)>;

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

}  // namespace

void BackUp(const std::string &target) {
  UnfinishedFile file(target);
  const Source source = OpenSource();
  Copy(VELKDBSqlite(source.get()), OpenTarget(file.path()).get());
  file.Publish();
}

}  // namespace operations
