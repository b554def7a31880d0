#include "connection.h"

#include <sqlite3.h>
#include <sys/stat.h>

#include <cstdlib>
#include <new>

#include "velk/velkdb.h"

namespace velkdb {
namespace {

struct Free {
  void operator()(char *memory) const { std::free(memory); }
};

/// The path with its directory part resolved, for SQLite refuses a symbolic link anywhere in the
/// path it is told to take as it is, and we mean the last step alone. "" when that cannot be done.
std::string WithDirectoryResolved(const std::string &path) {
  const size_t slash = path.rfind('/');
  const std::string directory = slash == std::string::npos ? "." : path.substr(0, slash + 1);
  const std::string name = slash == std::string::npos ? path : path.substr(slash + 1);
  if (name.empty()) return "";
  const std::unique_ptr<char, Free> resolved(realpath(directory.c_str(), nullptr));
  return resolved == nullptr ? "" : std::string(resolved.get()) + "/" + name;
}

bool Switch(sqlite3 *connection, int setting, int value) {
  return sqlite3_db_config(connection, setting, value, nullptr) == SQLITE_OK;
}

bool Open(const std::string &path, VELKDBHandle &handle) {
  // A handle belongs to one thread at a time, so SQLite need not lock it.
  constexpr int kFlags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_NOMUTEX;
  sqlite3 *connection = nullptr;
  const int outcome = sqlite3_open_v2(path.c_str(), &connection, kFlags, nullptr);
  handle.sqlite.reset(connection);  // to be closed even when it failed
  return outcome == SQLITE_OK && Switch(connection, SQLITE_DBCONFIG_DEFENSIVE, 1) &&
         Switch(connection, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0);
}

bool IsEmpty(const std::string &path) {
  struct stat file {};
  return stat(path.c_str(), &file) == 0 && file.st_size == 0;
}

/// Whoever makes the first change may not be allowed to make a log beside the file any more. Where
/// it cannot be made now either, that change fails, with a text to it.
void SwitchToLog(VELKDBHandle &handle) {
  const auto switch_now = [&handle] {
    return sqlite3_exec(handle.sqlite.get(), "PRAGMA journal_mode = WAL", nullptr, nullptr,
                        nullptr);
  };
  handle.busy_wait.StartStatement();
  for (int attempt = 0; switch_now() == SQLITE_BUSY && handle.busy_wait.Sleep(attempt);) ++attempt;
  handle.busy_wait.EndStatement();
}

std::unique_ptr<VELKDBHandle> Connect(const std::string &path) {
  auto handle = std::make_unique<VELKDBHandle>();
  const std::string resolved = WithDirectoryResolved(path);
  if (resolved.empty() || !Open(resolved, *handle)) return nullptr;
  handle->busy_wait.Attach(handle->sqlite.get());
  if (IsEmpty(resolved)) SwitchToLog(*handle);
  handle->durability.Attach(handle->sqlite.get());
  // Reads the file, and by that opens its log while the caller still is who may open it. A file
  // that cannot be read now is the first statement's failure, with a text to it.
  handle->durability.Refresh();
  return handle;
}

}  // namespace

void ConnectionDeleter::operator()(sqlite3 *connection) const {
  sqlite3_close_v2(connection);
}

}  // namespace velkdb

VELKDBHandle *VELKDBConnect(const char * /*host*/, const char * /*user*/, const char * /*password*/,
                            const char *path) {
  if (path == nullptr) return nullptr;
  try {
    return velkdb::Connect(path).release();
  } catch (const std::bad_alloc &) {
    return nullptr;
  }
}

const char *VELKDBErrorGet(VELKDBHandle *handle) {
  return handle == nullptr ? "" : handle->error.c_str();
}

void VELKDBClose(VELKDBHandle *handle) {
  delete handle;
}

struct sqlite3 *VELKDBSqlite(VELKDBHandle *handle) {
  return handle == nullptr ? nullptr : handle->sqlite.get();
}
