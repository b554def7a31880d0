#include <optional>

#include "internal/log.h"
#include "velksharing/store.h"

namespace VELK::sharing::db {
namespace {

using internal::LogError;

constexpr char kSource[] = "object_db";

}  // namespace

class ObjectDBPrivate {
 public:
  ObjectDBPrivate(BaseDB &db, const char *table) : db_(db), table_(table == nullptr ? "" : table) {}

  BaseDB &db() { return db_; }
  const std::string &table() const { return table_; }
  /// Made when it is first asked for: most stores are made for one record.
  Condition &condition() { return condition_ ? *condition_ : condition_.emplace(db_); }

  /// Runs "SELECT `columns` FROM" the table for the rows that the condition admits, and clears the
  /// condition, whatever the outcome.
  bool Select(const char *columns, Result &result) {
    std::string sql = "SELECT ";
    sql.append(columns).append(" FROM ").append(table_);
    if (!condition_ || condition_->IsEmpty()) return db_.Execute(sql, result);
    sql += condition_->GetSQL();
    const bool done = db_.Execute(sql, result);
    condition_->Clear();
    return done;
  }

 private:
  BaseDB &db_;
  const std::string table_;
  std::optional<Condition> condition_;
};

ObjectDB::ObjectDB(BaseDB &db, const char *table)
    : private_(std::make_unique<ObjectDBPrivate>(db, table)) {}
ObjectDB::~ObjectDB() = default;

bool ObjectDB::Create(record::Object &obj) {
  if (!obj.IsLegal()) {
    LogError(kSource, "%s:%d (%u) obj invalid\n");
    return false;
  }
  if (!GetDB().Insert(GetTable(), obj.GetFieldList())) {
    LogError(kSource, "%s:%d (%u) insert failed\n");
    return false;
  }
  int id = 0;
  if (!GetDB().GetLastInsertId(id)) return false;
  obj.set_id(id);
  return true;
}

bool ObjectDB::Update(const record::Object &obj) {
  if (!obj.IsLegal()) {
    LogError(kSource, "%s:%d (%u) obj invalid\n");
    return false;
  }
  if (!GetDB().Update(GetTable(), obj.GetFieldMap(), obj.get_id())) {
    LogError(kSource, "%s:%d (%u) update failed\n");
    return false;
  }
  return true;
}

bool ObjectDB::Delete(int id) {
  if (GetDB().Delete(GetTable(), id)) return true;
  LogError(kSource, "%s:%d (%u) delete failed\n");
  return false;
}

bool ObjectDB::Delete(const record::Object &obj) {
  return Delete(obj.get_id());
}

bool ObjectDB::GetById(int id, record::Object &obj) const {
  return LoadFirst("SELECT * FROM " + GetTable() + " WHERE id = " + std::to_string(id), obj);
}

bool ObjectDB::Count(int &count) const {
  Result result;
  Row row;
  if (!private_->Select("COUNT(*) AS c", result) || !result.NextRow(row)) return false;
  count = row.GetField("c").AsInt(0);
  return true;
}

Condition &ObjectDB::GetCondition() const {
  return private_->condition();
}

template <typename T>
bool ObjectDB::Query(std::vector<T> &out) const {
  Result result;
  if (!private_->Select("*", result)) return false;
  out.clear();
  Row row;
  while (result.NextRow(row)) {
    // Loaded where it stays: moving a record copies its JSON.
    if (!out.emplace_back().FromRow(row)) out.pop_back();
  }
  return true;
}

template VELK_EXPORT bool ObjectDB::Query(std::vector<record::Entry> &out) const;
template VELK_EXPORT bool ObjectDB::Query(std::vector<record::Session> &out) const;
template VELK_EXPORT bool ObjectDB::Query(std::vector<record::Token> &out) const;

bool ObjectDB::LoadFirst(const std::string &sql, record::Object &obj) const {
  Result result;
  Row row;
  return GetDB().Execute(sql, result) && result.IsGood() && result.NextRow(row) && obj.FromRow(row);
}

BaseDB &ObjectDB::GetDB() const {
  return private_->db();
}

const std::string &ObjectDB::GetTable() const {
  return private_->table();
}

}  // namespace VELK::sharing::db
