#include <sqlite3.h>

#include "internal/log.h"
#include "internal/platform_ptr.h"
#include "internal/run_as.h"
#include "velk/velkcore.h"
#include "velksharing/constants.h"
#include "velksharing/database.h"

namespace VELK::sharing::db {
namespace {

using internal::DatabasePtr;
using internal::kSystemGid;
using internal::kSystemUid;
using internal::LogError;
using internal::RunAsGuard;

constexpr char kSource[] = "base_db";

}  // namespace

class BaseDBPrivate {
 public:
  BaseDBPrivate(const std::string &path, unsigned int mode) : path_(path) {
    good_ = EnsureFile(mode) && Connect() && SetUp();
  }
  BaseDBPrivate(const BaseDBPrivate &) = delete;
  BaseDBPrivate &operator=(const BaseDBPrivate &) = delete;
  ~BaseDBPrivate() = default;

  bool IsGood() const { return handle_ != nullptr && good_; }

  bool Execute(const std::string &sql, Result *result) {
    DBResult *rows = nullptr;
    const bool done = Run(sql, rows);
    if (result == nullptr) {
      VELKDBFreeResult(rows);
    } else {
      result->SetResult(rows);
    }
    return done;
  }

  std::string GetLastError() const { return last_error_; }
  std::string GetLastQuery() const { return last_query_; }

  bool GetLastInsertId(int &id) const {
    if (!IsGood()) return false;
    id = static_cast<int>(sqlite3_last_insert_rowid(VELKDBSqlite(handle_.get())));
    return true;
  }

  bool Commit() {
    if (Execute("COMMIT", nullptr)) return true;
    Execute("ROLLBACK", nullptr);
    return false;
  }

  /// Appends what Escape() gives.
  void AppendEscaped(std::string &sql, const std::string &text) const {
    const size_t start = sql.size();
    const size_t capacity = 2 * text.size();
    // One byte more than the escaper may fill, so that there is always a terminating zero.
    sql.resize(start + capacity + 1);
    if (VELKDBEscapeStringEX2(0, &sql[start], capacity, text.data(), text.size()) == -1) {
      LogError(kSource, "%s:%d (%u) escape failed\n\n");
      sql[start] = '\0';
    }
    sql.resize(sql.find('\0', start));
  }

 private:
  /// Makes the file, under the system account, when it is missing.
  bool EnsureFile(unsigned int mode) {
    if (VLIBCFileExist(path_.c_str())) return true;
    const RunAsGuard as_system(kSystemUid, kSystemGid, kSource);
    if (!as_system.switched()) {
      LogError(kSource, "%s:%d (%u) failed to run as system\n\n");
      return false;
    }
    if (VLIBCFileTouch(path_.c_str()) == -1) {
      LogError(kSource, "%s:%d (%u) create database failed on %s\n\n", path_.c_str());
      return false;
    }
    if (VELKFSAclChmod(path_.c_str(), -1, mode) == -1) {
      LogError(kSource, "%s:%d (%u) change mode failed on %s\n\n", path_.c_str());
      return false;
    }
    return true;
  }

  bool Connect() {
    {
      const RunAsGuard as_system(kSystemUid, kSystemGid, kSource);
      if (!as_system.switched()) {
        LogError(kSource, "%s:%d (%u) failed to run as system\n\n");
        return false;
      }
      handle_.reset(VELKDBConnect("", "", "", path_.c_str()));
    }
    if (handle_ == nullptr) LogError(kSource, "%s:%d (%u) db connect failed\n\n");
    return handle_ != nullptr;
  }

  bool SetUp() {
    const bool done = Execute("PRAGMA cache_size = 5000", nullptr) &&
                      Execute("PRAGMA foreign_keys = ON", nullptr);
    if (!done) LogError(kSource, "%s:%d (%u) init failed\n\n");
    return done;
  }

  bool Run(const std::string &sql, DBResult *&rows) {
    if (!IsGood()) {
      LogError(kSource, "%s:%d (%u) db is not good.\n\n");
      return false;
    }
    last_query_ = sql;
    if (VELKDBExecute(handle_.get(), sql.c_str(), &rows) != -1) return true;
    last_error_ = VELKDBErrorGet(handle_.get());
    return false;
  }

  const std::string path_;
  bool good_ = true;  // while the constructor runs, so that it can execute statements
  DatabasePtr handle_;
  std::string last_error_;
  std::string last_query_;
};

BaseDB::BaseDB(const std::string &path, unsigned int mode)
    : private_(std::make_unique<BaseDBPrivate>(path, mode)) {}
BaseDB::~BaseDB() = default;

bool BaseDB::IsGood() const {
  return private_->IsGood();
}

bool BaseDB::Execute(const std::string &sql, Result *result) {
  return private_->Execute(sql, result);
}

bool BaseDB::Execute(const std::string &sql, Result &result) {
  return Execute(sql, &result);
}

std::string BaseDB::GetLastError() const {
  return private_->GetLastError();
}

std::string BaseDB::GetLastQuery() const {
  return private_->GetLastQuery();
}

bool BaseDB::GetLastInsertId(int &id) const {
  return private_->GetLastInsertId(id);
}

bool BaseDB::Begin() {
  return Execute("BEGIN TRANSACTION");
}

bool BaseDB::Commit() {
  return private_->Commit();
}

bool BaseDB::Vacuum() {
  return Execute("VACUUM");
}

std::string BaseDB::Escape(const std::string &text) const {
  std::string escaped;
  private_->AppendEscaped(escaped, text);
  return escaped;
}

bool BaseDB::Insert(const std::string &table, const std::vector<std::string> &values) {
  std::string sql = "INSERT INTO " + table + " VALUES (NULL,";
  const char *separator = "'";
  for (const std::string &value : values) {
    sql += separator;
    private_->AppendEscaped(sql, value);
    sql += '\'';
    separator = ",'";
  }
  sql += ")";
  return Execute(sql);
}

bool BaseDB::Update(const std::string &table, const std::map<std::string, std::string> &columns,
                    int id) {
  std::string sql = "UPDATE " + table + " SET ";
  const char *separator = "";
  for (const auto &[column, value] : columns) {
    if (column == SZK_ID_) continue;
    sql += separator;
    private_->AppendEscaped(sql, column);
    sql += "='";
    private_->AppendEscaped(sql, value);
    sql += '\'';
    separator = ",";
  }
  sql += " WHERE id=" + std::to_string(id);
  return Execute(sql);
}

bool BaseDB::Delete(const std::string &table, int id) {
  return Execute("DELETE FROM " + table + " WHERE id=" + std::to_string(id));
}

}  // namespace VELK::sharing::db
