#include "internal/purge.h"
#include "velk/velkrandom.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"

namespace VELK::sharing::db {

class SessionDBPrivate : public ObjectDB {
 public:
  explicit SessionDBPrivate(BaseDB &db) : ObjectDB(db, "session") {}

  using ObjectDB::Delete;
  bool Delete(int id) override { return ObjectDB::Delete(id); }

  bool CreateWithSessionId(record::Session &session) {
    static RANDOM::VELKRandom random;
    std::string session_id;
    int attempt = 0;
    bool created;
    do {
      ++attempt;
      random.getString(RANDOM::POOL_URL_FRIENDLY, SHARING_SESSION_LENGTH, session_id);
      session.set_session_id(session_id);  // "" when there was no randomness: not legal
      created = ObjectDB::Create(session.GetObject());
    } while (!created && attempt <= SHARING_MAX_RETRY_TIMES);
    return created;
  }

  bool GetBySessionId(const std::string &session_id, record::Session &session) const {
    return LoadFirst("SELECT * FROM " + WhereSessionId(session_id), session.GetObject());
  }

  bool DeleteBySessionId(const std::string &session_id) {
    return GetDB().Execute("DELETE FROM " + WhereSessionId(session_id));
  }

  bool PurgeExpired(float probability) {
    return internal::PurgeLapsed(GetDB(), GetTable(), probability);
  }

 private:
  std::string WhereSessionId(const std::string &session_id) const {
    return GetTable() + " WHERE session_id = '" + GetDB().Escape(session_id) + "'";
  }
};

SessionDB::SessionDB(BaseDB &db) : private_(std::make_unique<SessionDBPrivate>(db)) {}
SessionDB::~SessionDB() = default;

bool SessionDB::Create(record::Session &session) {
  return private_->Create(session.GetObject());
}

bool SessionDB::CreateWithSessionId(record::Session &session) {
  return private_->CreateWithSessionId(session);
}

bool SessionDB::Update(const record::Session &session) {
  return private_->Update(session.GetCObject());
}

bool SessionDB::Delete(int id) {
  return private_->Delete(id);
}

bool SessionDB::Delete(const record::Session &session) {
  return private_->Delete(session.get_id());
}

bool SessionDB::GetById(int id, record::Session &session) const {
  return private_->GetById(id, session.GetObject());
}

bool SessionDB::Count(int &count) const {
  return private_->Count(count);
}

Condition &SessionDB::GetCondition() const {
  return private_->GetCondition();
}

bool SessionDB::Query(std::vector<record::Session> &sessions) const {
  return private_->Query(sessions);
}

bool SessionDB::GetBySessionId(const std::string &session_id, record::Session &session) const {
  return private_->GetBySessionId(session_id, session);
}

bool SessionDB::DeleteBySessionId(const std::string &session_id) {
  return private_->DeleteBySessionId(session_id);
}

bool SessionDB::PurgeExpired(float probability) {
  return private_->PurgeExpired(probability);
}

}  // namespace VELK::sharing::db
