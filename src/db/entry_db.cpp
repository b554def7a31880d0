#include <ctime>

#include "velk/velkrandom.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"
#include "velksharing/utils.h"

namespace VELK::sharing::db {
namespace {

/// What makes a link expired: a time limit that lies in the past, or a use limit that is reached.
std::string ExpiredExpression() {
  return " ((expire_at != 0 AND expire_at < " + std::to_string(time(nullptr)) +
         ") OR (expire_times != 0 AND use_count >= expire_times))";
}

}  // namespace

class EntryDBPrivate : public ObjectDB {
 public:
  explicit EntryDBPrivate(BaseDB &db) : ObjectDB(db, "entry") {}

  using ObjectDB::Delete;
  bool Delete(int id) override { return ObjectDB::Delete(id); }

  bool CreateWithHash(record::Entry &entry) {
    static RANDOM::VELKRandom random;
    unsigned int length = SHARING_HASH_LENGTH;
    std::string hash;
    int attempt = 0;
    bool created;
    do {
      ++attempt;
      random.getString(RANDOM::POOL_ALPHA_NUMERIC, length, hash);  // "" on failure: not legal
      entry.set_hash(hash);
      created = ObjectDB::Create(entry.GetObject());
      if (attempt % 3 == 0) ++length;
    } while (!created && attempt <= SHARING_MAX_RETRY_TIMES);
    return created;
  }

  bool GetByHash(const std::string &hash, record::Entry &entry) const {
    return LoadFirst("SELECT * FROM " + GetTable() + " WHERE hash = '" + GetDB().Escape(hash) + "'",
                     entry.GetObject());
  }

  bool DeleteByOwnerUid(unsigned int uid) {
    return GetDB().Execute("DELETE FROM " + GetTable() +
                           " WHERE owner_uid = " + std::to_string(uid));
  }

  bool PurgeExpired(float probability) {
    if (!IsProbabilityHit(probability)) return true;
    return GetDB().Execute("DELETE FROM " + GetTable() + " WHERE auto_gc = 1 AND " +
                           ExpiredExpression());
  }

  bool PurgeExpiredByOwnerProject(unsigned int uid, const std::string &project) {
    std::string sql = "DELETE FROM " + GetTable() + " WHERE";
    if (uid != UID_ERR) sql += " owner_uid = " + std::to_string(uid) + " AND";
    if (!project.empty()) sql += " project_name = '" + GetDB().Escape(project) + "' AND";
    return GetDB().Execute(sql + ExpiredExpression());
  }
};

EntryDB::EntryDB(BaseDB &db) : private_(std::make_unique<EntryDBPrivate>(db)) {}
EntryDB::~EntryDB() = default;

bool EntryDB::Create(record::Entry &entry) {
  return private_->Create(entry.GetObject());
}

bool EntryDB::CreateWithHash(record::Entry &entry) {
  return private_->CreateWithHash(entry);
}

bool EntryDB::Update(const record::Entry &entry) {
  return private_->Update(entry.GetCObject());
}

bool EntryDB::Delete(int id) {
  return private_->Delete(id);
}

bool EntryDB::Delete(const record::Entry &entry) {
  return private_->Delete(entry.get_id());
}

bool EntryDB::GetById(int id, record::Entry &entry) const {
  return private_->GetById(id, entry.GetObject());
}

bool EntryDB::GetByToken(const record::Token &token, record::Entry &entry) const {
  return GetById(token.get_entry_id(), entry);
}

bool EntryDB::GetByHash(const std::string &hash, record::Entry &entry) const {
  return private_->GetByHash(hash, entry);
}

bool EntryDB::Count(int &count) const {
  return private_->Count(count);
}

Condition &EntryDB::GetCondition() const {
  return private_->GetCondition();
}

bool EntryDB::Query(std::vector<record::Entry> &entries) const {
  return private_->Query(entries);
}

bool EntryDB::DeleteByOwnerUid(unsigned int uid) {
  return private_->DeleteByOwnerUid(uid);
}

bool EntryDB::PurgeExpired(float probability) {
  return private_->PurgeExpired(probability);
}

bool EntryDB::PurgeExpiredByOwnerProject(unsigned int uid, const std::string &project) {
  return private_->PurgeExpiredByOwnerProject(uid, project);
}

}  // namespace VELK::sharing::db
