#include <cstdio>
#include <memory>
#include <string>

#include "internal/log.h"
#include "internal/run_as.h"
#include "velk_paths.h"
#include "velksharing/constants.h"
#include "velksharing/database.h"

namespace VELK::sharing::db {
namespace {

using internal::LogError;
using internal::RunAsGuard;

constexpr char kSource[] = "sharing_db";
constexpr char kSchemaDirectory[] = VELK_ROOT "/share/velksharing/db_schema";
constexpr unsigned int kFileMode = 0660;
constexpr int kSchemaVersion = 2;

struct FileCloser {
  void operator()(std::FILE *file) const { std::fclose(file); }
};
using FilePtr = std::unique_ptr<std::FILE, FileCloser>;

/// Appends the rest of `file` to `text`.
/// @return false, with errno set, when reading failed; a folder, for one, opens but does not read.
bool ReadAll(std::FILE *file, std::string &text) {
  char chunk[4096];
  while (const size_t length = std::fread(chunk, 1, sizeof chunk, file)) text.append(chunk, length);
  return std::ferror(file) == 0;
}

}  // namespace

class SharingDBPrivate {
 public:
  explicit SharingDBPrivate(SharingDB *db) : pdb_(db), migrated_(Migration()) {}

  bool migrated() const { return migrated_; }

 private:
  /// Brings the schema to kSchemaVersion. A newer one is left as it is.
  bool Migration() {
    int current = 0;
    if (!ReadVersion(current)) return false;
    for (int version = current; version < kSchemaVersion; ++version) {
      if (MigrateTo(version + 1)) continue;
      LogError(kSource, "%s:%d (%u) cannot migrate from %d to %d\n\n", version, version + 1);
      return false;
    }
    return true;
  }

  bool ReadVersion(int &version) {
    Result result;
    Row row;
    VELK_REFUSE_IF(kSource, !pdb_->Execute("PRAGMA user_version", result));
    if (!result.NextRow(row) || !row.IsGood()) {
      LogError(kSource, "%s:%d (%u) user_version is not correct\n\n");
      return false;
    }
    version = row.GetField("user_version").AsInt(0);
    return true;
  }

  /// Runs the script of one version. The scripts bring their own transactions and set the version
  /// themselves.
  bool MigrateTo(int version) {
    std::string script;
    if (!ReadScript(std::string(kSchemaDirectory) + "/" + std::to_string(version) + ".sql", script))
      return false;
    if (pdb_->Execute(script)) return true;
    internal::LogFailedCondition(kSource, "!pdb_->Execute(sstr.str().c_str())");
    return false;
  }

  bool ReadScript(const std::string &path, std::string &script) {
    FilePtr file;
    {
      const RunAsGuard as_system(internal::kSystemUid, internal::kSystemGid, kSource);
      if (!as_system.switched()) {
        LogError(kSource, "%s:%d (%u) failed to run as system\n\n");
        return false;
      }
      file.reset(std::fopen(path.c_str(), "re"));
    }
    if (file != nullptr && ReadAll(file.get(), script)) return true;
    LogError(kSource, "%s:%d (%u) file %s open failed %m.\n\n", path.c_str());
    return false;
  }

  SharingDB *const pdb_;
  const bool migrated_;
};

SharingDB &SharingDB::Instance() {
  static SharingDB instance;
  return instance;
}

SharingDB::SharingDB()
    : BaseDB(SZF_SHARING_DB_PATH, kFileMode), private_(std::make_unique<SharingDBPrivate>(this)) {}
SharingDB::~SharingDB() = default;

bool SharingDB::IsGood() const {
  return private_->migrated() && BaseDB::IsGood();
}

}  // namespace VELK::sharing::db
