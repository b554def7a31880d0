#include <array>
#include <ctime>

#include "internal/field_map.h"
#include "internal/log.h"
#include "velksharing/constants.h"
#include "velksharing/database.h"
#include "velksharing/record.h"
#include "velksharing/utils.h"

namespace VELK::sharing::record {
namespace {

using internal::Origin;

constexpr char kSource[] = "session";

}  // namespace

class SessionPrivate : public Object {
 public:
  SessionPrivate() = default;
  SessionPrivate(const SessionPrivate &) = default;
  SessionPrivate(SessionPrivate &&) = default;
  SessionPrivate &operator=(const SessionPrivate &) = default;
  /// Exchanges the texts and copies the rest.
  SessionPrivate &operator=(SessionPrivate &&other) {
    id_ = other.id_;
    session_id_.swap(other.session_id_);
    uid_ = other.uid_;
    ip_.swap(other.ip_);
    timeout_ = other.timeout_;
    return *this;
  }

  std::vector<std::string> GetFieldList() const override {
    return {session_id_, std::to_string(uid_), ip_, ToString(timeout_)};
  }

  std::map<std::string, std::string> GetFieldMap() const override {
    return internal::FieldMap(std::array{SZK_SESSION_ID_, SZK_UID_, SZK_IP_, SZK_TIMEOUT},
                              GetFieldList());
  }

  // Log readers know these messages by their line numbers.
  bool IsLegal() const override {
    VELK_REFUSE_IF(Origin(kSource, 87), "" == session_id_);
    VELK_REFUSE_IF(Origin(kSource, 88), "" == ip_);
    VELK_REFUSE_IF(Origin(kSource, 89), time(NULL) >= timeout_);
    return true;
  }

  void ToJSON(Json::Value &out) const override {
    if (!out.isObject()) out = Json::Value(Json::objectValue);
    out[SZK_SESSION_ID_] = session_id_;
    out[SZK_UID_] = uid_;
    out[SZK_IP_] = ip_;
    out[SZK_TIMEOUT] = static_cast<Json::Int64>(timeout_);
  }

  bool FromRow(const db::Row &row) override {
    id_ = row.GetField(SZK_ID_).AsInt(0);
    session_id_ = row.GetField(SZK_SESSION_ID_).AsString("");
    uid_ = row.GetField(SZK_UID_).AsUInt(0);
    ip_ = row.GetField(SZK_IP_).AsString("");
    timeout_ = row.GetField(SZK_TIMEOUT).AsTime(0);
    return IsLegal();
  }

  int get_id() const override { return id_; }
  void set_id(int id) override { id_ = id; }

  int id_ = 0;
  std::string session_id_;
  unsigned int uid_ = UID_ERR;
  std::string ip_;
  long timeout_ = 0;
};

Session::Session() : private_(std::make_unique<SessionPrivate>()) {}
Session::Session(const Session &other)
    : private_(std::make_unique<SessionPrivate>(*other.private_)) {}
Session::Session(Session &&other)
    : private_(std::make_unique<SessionPrivate>(std::move(*other.private_))) {}
Session &Session::operator=(const Session &other) {
  *private_ = *other.private_;
  return *this;
}
Session &Session::operator=(Session &&other) {
  *private_ = std::move(*other.private_);
  return *this;
}
Session::~Session() = default;

Object &Session::GetObject() {
  return *private_;
}
const Object &Session::GetCObject() const {
  return *private_;
}

std::vector<std::string> Session::GetFieldList() const {
  return private_->GetFieldList();
}
std::map<std::string, std::string> Session::GetFieldMap() const {
  return private_->GetFieldMap();
}
bool Session::IsLegal() const {
  return private_->IsLegal();
}
void Session::ToJSON(Json::Value &out) const {
  private_->ToJSON(out);
}
bool Session::FromRow(const db::Row &row) {
  return private_->FromRow(row);
}

int Session::get_id() const {
  return private_->id_;
}
Session &Session::set_id(int id) {
  private_->id_ = id;
  return *this;
}

std::string Session::get_session_id() const {
  return private_->session_id_;
}
Session &Session::set_session_id(const std::string &session_id) {
  private_->session_id_ = session_id;
  return *this;
}

unsigned int Session::get_uid() const {
  return private_->uid_;
}
Session &Session::set_uid(unsigned int uid) {
  private_->uid_ = uid;
  return *this;
}

std::string Session::get_ip() const {
  return private_->ip_;
}
Session &Session::set_ip(const std::string &ip) {
  private_->ip_ = ip;
  return *this;
}

long Session::get_timeout() const {
  return private_->timeout_;
}
Session &Session::set_timeout(long timeout) {
  private_->timeout_ = timeout;
  return *this;
}

}  // namespace VELK::sharing::record
