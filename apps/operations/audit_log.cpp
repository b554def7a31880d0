#include "operations/audit_log.h"

#include "audit/database.h"
#include "audit/trail.h"
#include "operations/accounts.h"
#include "operations/visit.h"
#include "velksharing/constants.h"

namespace operations {
namespace {

constexpr int64_t kMicroseconds = 1'000'000;

Failure Unreadable(const audit::DatabaseError &error) {
  return Failure(Failure::DATABASE, std::string("the audit trail ") + audit::kTrailPath +
                                        " cannot be read: " + error.what());
}

}  // namespace

AuditLog::AuditLog(const AuditQuery &query) {
  query_.entry_id = query.entry_id;
  query_.since = query.since.value_or(0) * kMicroseconds;
  query_.limit = query.limit.value_or(-1);
}

bool AuditLog::Read(const std::function<void(const audit::Record &)> &take) {
  try {
    if (!Open()) return false;
    query_.after_id = reader_->Read(query_, take);
    query_.limit = -1;  // what comes later is not counted
    return true;
  } catch (const audit::DatabaseError &error) {
    throw Unreadable(error);
  }
}

bool AuditLog::Open() {
  if (reader_ != nullptr && !reader_->HasMoved()) return true;
  reader_.reset();
  query_.after_id = 0;
  try {
    reader_ = std::make_unique<audit::Reader>(audit::kTrailPath);
    return true;
  } catch (const audit::DatabaseError &error) {
    if (error.IsMissing()) return false;
    throw;
  }
}

Failure NoAuditTrail() {
  return Failure(Failure::NOT_FOUND,
                 "there is no audit trail; velksharing-web keeps one when it is configured with "
                 "“audit = on”");
}

const char *EventName(audit::Event event) {
  switch (event) {
    case audit::Event::LOGIN:
      return "login";
    case audit::Event::ENTER:
      return "enter";
    case audit::Event::LOGOUT:
      return "logout";
  }
  return "unknown";
}

const char *ResultName(const audit::Record &record) {
  const bool is_logout = record.event == audit::Event::LOGOUT;
  return (is_logout ? ExplainLogout(record.result) : ExplainLogin(record.result)).name;
}

Json::Value ToJson(const audit::Record &record) {
  Json::Value json(Json::objectValue);
  json["time"] = static_cast<Json::Int64>(record.time / kMicroseconds);
  json["microseconds"] = static_cast<Json::Int64>(record.time % kMicroseconds);
  json[VELK::sharing::SZK_ENTRY_ID] = record.entry_id;
  json["event"] = EventName(record.event);
  json["code"] = record.result;
  json["name"] = ResultName(record);
  json["uid"] = record.uid ? Json::Value(*record.uid) : Json::Value();
  json["account"] = record.uid ? AccountText(*record.uid) : "";
  json["address"] = record.address;
  return json;
}

}  // namespace operations
