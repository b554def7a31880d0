#ifndef TESTS_SUPPORT_VELK_ROOT_H
#define TESTS_SUPPORT_VELK_ROOT_H

#include <filesystem>
#include <string>

#include "support/build_folders.h"
#include "support/temp_dir.h"
#include "velk_paths.h"

/// The files below VELK_ROOT that tests make and change. Tests that do so lock "velk_root".

namespace velk_test {

/// Whether the root belongs to the tests: an installed one may hold somebody's links.
inline bool OwnsVelkRoot() {
  return std::string(VELK_ROOT).rfind(VELK_BINARY_DIR "/", 0) == 0;
}

/// Whether saslauthd's socket belongs to the tests: another may be that of a running one.
inline bool OwnsSaslauthdSocket() {
  return std::string(VELK_SASLAUTHD_SOCKET).rfind(VELK_BINARY_DIR "/", 0) == 0;
}

inline std::string SharingDatabasePath() {
  return VELK_ROOT "/etc/private/session/sharing.db";
}

inline std::string InstalledScript(const std::string &name) {
  return VELK_ROOT "/share/velksharing/db_schema/" + name;
}

/// Removes the sharing database with its journals.
inline void RemoveSharingDatabase() {
  for (const char *suffix : {"", "-wal", "-shm", "-journal"})
    std::filesystem::remove_all(SharingDatabasePath() + suffix);
}

/// Removes the database of blocked addresses with its journals.
inline void RemoveAutoBlockDatabase() {
  for (const char *suffix : {"", "-wal", "-shm", "-journal"})
    std::filesystem::remove_all(std::string(VELK_ROOT "/etc/private/autoblock.db") + suffix);
}

/// Puts the schema scripts where the library reads them, and nothing else.
inline void InstallScripts() {
  std::filesystem::remove_all(VELK_ROOT "/share/velksharing/db_schema");
  std::filesystem::create_directories(VELK_ROOT "/share/velksharing/db_schema");
  for (const char *name : {"1.sql", "2.sql"})
    WriteFile(InstalledScript(name), ReadFile(VELK_SOURCE_DIR "/schema/" + std::string(name)));
}

}  // namespace velk_test

#endif
