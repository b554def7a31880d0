#include "operations/database.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <system_error>

#include "velk_paths.h"
#include "velksharing/constants.h"

namespace operations {
namespace {

using VELK::sharing::SZF_SHARING_DB_PATH;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;

constexpr char kSchemaFolder[] = VELK_ROOT "/share/velksharing/db_schema";
constexpr int kSchemaVersion = 2;

std::string ErrorText(int error) {
  return std::generic_category().message(error);
}

bool MayActAsSystemAccount() {
  return geteuid() == 0 || geteuid() == static_cast<uid_t>(VELK_SYSTEM_UID);
}

std::string WhyMissing() {
  const std::string folder = std::filesystem::path(SZF_SHARING_DB_PATH).parent_path();
  if (access(folder.c_str(), F_OK) != 0) return "its folder: " + ErrorText(errno);
  return "the file could not be made in " + folder;
}

bool LooksLikeSqlite(int file) {
  static constexpr char kMagic[] = "SQLite format 3";
  char head[sizeof kMagic] = "";
  const ssize_t count = pread(file, head, sizeof head, 0);
  return count == 0 || (count == sizeof head && std::memcmp(head, kMagic, sizeof head) == 0);
}

std::string WhyUnreadable() {
  const int file = open(SZF_SHARING_DB_PATH, O_RDWR | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
  if (file < 0) return errno == ELOOP ? "it is a symbolic link" : ErrorText(errno);
  struct stat info = {};
  const bool regular = fstat(file, &info) == 0 && S_ISREG(info.st_mode);
  const bool sqlite = regular && LooksLikeSqlite(file);
  close(file);
  if (!regular) return "it is not a regular file";
  return sqlite ? "" : "it is not an SQLite database";
}

std::string WhyUnusable() {
  if (!MayActAsSystemAccount()) {
    return "only root and the system account (user id " + std::to_string(VELK_SYSTEM_UID) +
           ") may use it";
  }
  struct stat info = {};
  if (lstat(SZF_SHARING_DB_PATH, &info) != 0)
    return errno == ENOENT ? WhyMissing() : ErrorText(errno);
  const std::string unreadable = WhyUnreadable();
  if (!unreadable.empty()) return unreadable;
  const std::string script = std::string(kSchemaFolder) + "/1.sql";
  if (access(script.c_str(), R_OK) != 0) return "schema script " + script + ": " + ErrorText(errno);
  return "the system log tells more";
}

Failure Unusable(const std::string &reason) {
  return Failure(Failure::DATABASE,
                 std::string("the database ") + SZF_SHARING_DB_PATH + " cannot be used: " + reason);
}

}  // namespace

SharingDB &SharingDatabase() {
  SharingDB &db = SharingDB::Instance();
  if (!db.IsGood()) throw DatabaseUnusable();
  return db;
}

std::unique_ptr<BaseDB> OpenForReading() {
  struct stat info = {};
  if (lstat(SZF_SHARING_DB_PATH, &info) != 0 && errno == ENOENT && MayActAsSystemAccount())
    throw Unusable("it does not exist yet; the first link makes it");
  auto db = std::make_unique<BaseDB>(SZF_SHARING_DB_PATH, 0660);
  if (!db->IsGood()) throw DatabaseUnusable();
  if (!db->Execute("PRAGMA query_only = ON")) throw Unusable(db->GetLastError());
  const long version = ReadNumber(*db, "SELECT user_version AS n FROM pragma_user_version");
  if (version < kSchemaVersion) {
    throw Unusable("its schema has version " + std::to_string(version) +
                   "; a command that changes something brings it up to date");
  }
  return db;
}

Failure DatabaseUnusable() {
  return Unusable(WhyUnusable());
}

Failure DatabaseFailure(const BaseDB &db, const std::string &what) {
  const std::string reason = db.GetLastError();
  return Failure(Failure::DATABASE, reason.empty() ? what : what + ": " + reason);
}

long ReadNumber(BaseDB &db, const std::string &sql) {
  Result result;
  Row row;
  if (!db.Execute(sql, result) || !result.NextRow(row))
    throw DatabaseFailure(db, "the database could not be read");
  return row.GetField("n").AsTime(0);
}

int RemovedRows(BaseDB &db) {
  return static_cast<int>(ReadNumber(db, "SELECT changes() AS n"));
}

Transaction::Transaction(BaseDB &db, Kind kind) : db_(db) {
  if (!db_.Execute(kind == WRITE ? "BEGIN IMMEDIATE" : "BEGIN"))
    throw DatabaseFailure(db_, "the database could not be locked");
}

Transaction::~Transaction() {
  if (open_) db_.Execute("ROLLBACK");
}

void Transaction::Commit() {
  // Not BaseDB::Commit(): the error of its rollback would take the place of the reason.
  if (!db_.Execute("COMMIT")) throw DatabaseFailure(db_, "the change could not be stored");
  open_ = false;
}

}  // namespace operations
