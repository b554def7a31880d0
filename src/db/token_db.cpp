#include "internal/purge.h"
#include "velksharing/store.h"

namespace VELK::sharing::db {

class TokenDBPrivate : public ObjectDB {
 public:
  explicit TokenDBPrivate(BaseDB &db) : ObjectDB(db, "token") {}

  using ObjectDB::Delete;
  bool Delete(int id) override { return ObjectDB::Delete(id); }

  bool GetBySessionEntry(const record::Session &session, const record::Entry &entry,
                         record::Token &token) const {
    return LoadFirst("SELECT * FROM " + GetTable() +
                         " WHERE session_id = " + std::to_string(session.get_id()) +
                         " AND entry_id = " + std::to_string(entry.get_id()),
                     token.GetObject());
  }

  bool PurgeByEntry(const record::Entry &entry) {
    return GetDB().Execute("DELETE FROM " + GetTable() +
                           " WHERE entry_id = " + std::to_string(entry.get_id()));
  }

  bool PurgeExpired(float probability) {
    return internal::PurgeLapsed(GetDB(), GetTable(), probability);
  }
};

TokenDB::TokenDB(BaseDB &db) : private_(std::make_unique<TokenDBPrivate>(db)) {}
TokenDB::~TokenDB() = default;

bool TokenDB::Create(record::Token &token) {
  return private_->Create(token.GetObject());
}

bool TokenDB::Update(const record::Token &token) {
  return private_->Update(token.GetCObject());
}

bool TokenDB::Delete(int id) {
  return private_->Delete(id);
}

bool TokenDB::Delete(const record::Token &token) {
  return private_->Delete(token.get_id());
}

bool TokenDB::GetById(int id, record::Token &token) const {
  return private_->GetById(id, token.GetObject());
}

bool TokenDB::Count(int &count) const {
  return private_->Count(count);
}

Condition &TokenDB::GetCondition() const {
  return private_->GetCondition();
}

bool TokenDB::Query(std::vector<record::Token> &tokens) const {
  return private_->Query(tokens);
}

bool TokenDB::GetBySessionEntry(const record::Session &session, const record::Entry &entry,
                                record::Token &token) const {
  return private_->GetBySessionEntry(session, entry, token);
}

bool TokenDB::PurgeByEntry(const record::Entry &entry) {
  return private_->PurgeByEntry(entry);
}

bool TokenDB::PurgeExpired(float probability) {
  return private_->PurgeExpired(probability);
}

}  // namespace VELK::sharing::db
