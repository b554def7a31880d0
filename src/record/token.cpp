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

constexpr char kSource[] = "token";

}  // namespace

class TokenPrivate : public Object {
 public:
  TokenPrivate() = default;
  TokenPrivate(const TokenPrivate &) = default;
  TokenPrivate &operator=(const TokenPrivate &) = default;

  std::vector<std::string> GetFieldList() const override {
    return {ToString(entry_id_), ToString(session_id_), ToString(timeout_)};
  }

  std::map<std::string, std::string> GetFieldMap() const override {
    return internal::FieldMap(std::array{SZK_ENTRY_ID, SZK_SESSION_ID_, SZK_TIMEOUT},
                              GetFieldList());
  }

  // Log readers know these messages by their line numbers.
  bool IsLegal() const override {
    VELK_REFUSE_IF(Origin(kSource, 81), 0 == entry_id_);
    VELK_REFUSE_IF(Origin(kSource, 82), 0 == session_id_);
    VELK_REFUSE_IF(Origin(kSource, 83), time(NULL) >= timeout_);
    return true;
  }

  void ToJSON(Json::Value &out) const override {
    if (!out.isObject()) out = Json::Value(Json::objectValue);
    out[SZK_ENTRY_ID] = entry_id_;
    out[SZK_SESSION_ID_] = session_id_;
    out[SZK_TIMEOUT] = static_cast<Json::Int64>(timeout_);
  }

  bool FromRow(const db::Row &row) override {
    id_ = row.GetField(SZK_ID_).AsInt(0);
    entry_id_ = row.GetField(SZK_ENTRY_ID).AsInt(0);
    session_id_ = row.GetField(SZK_SESSION_ID_).AsInt(0);
    timeout_ = row.GetField(SZK_TIMEOUT).AsTime(0);
    return IsLegal();
  }

  int get_id() const override { return id_; }
  void set_id(int id) override { id_ = id; }

  int id_ = 0;
  int entry_id_ = 0;
  int session_id_ = 0;
  long timeout_ = 0;
};

Token::Token() : private_(std::make_unique<TokenPrivate>()) {}
Token::Token(const Token &other) : private_(std::make_unique<TokenPrivate>(*other.private_)) {}
Token::Token(Token &&other) : Token(static_cast<const Token &>(other)) {}  // numbers: a copy
Token &Token::operator=(const Token &other) {
  *private_ = *other.private_;
  return *this;
}
Token &Token::operator=(Token &&other) {
  return *this = static_cast<const Token &>(other);
}
Token::~Token() = default;

Object &Token::GetObject() {
  return *private_;
}
const Object &Token::GetCObject() const {
  return *private_;
}

std::vector<std::string> Token::GetFieldList() const {
  return private_->GetFieldList();
}
std::map<std::string, std::string> Token::GetFieldMap() const {
  return private_->GetFieldMap();
}
bool Token::IsLegal() const {
  return private_->IsLegal();
}
void Token::ToJSON(Json::Value &out) const {
  private_->ToJSON(out);
}
bool Token::FromRow(const db::Row &row) {
  return private_->FromRow(row);
}

int Token::get_id() const {
  return private_->id_;
}
Token &Token::set_id(int id) {
  private_->id_ = id;
  return *this;
}

int Token::get_entry_id() const {
  return private_->entry_id_;
}
Token &Token::set_entry_id(int entry_id) {
  private_->entry_id_ = entry_id;
  return *this;
}

int Token::get_session_id() const {
  return private_->session_id_;
}
Token &Token::set_session_id(int session_id) {
  private_->session_id_ = session_id;
  return *this;
}

long Token::get_timeout() const {
  return private_->timeout_;
}
Token &Token::set_timeout(long timeout) {
  private_->timeout_ = timeout;
  return *this;
}

}  // namespace VELK::sharing::record
