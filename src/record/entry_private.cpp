#include "record/entry_private.h"

#include <array>

#include "internal/field_map.h"
#include "internal/json.h"
#include "velksharing/database.h"
#include "velksharing/utils.h"

namespace VELK::sharing::record {
namespace {

using internal::JsonArray;

// Kinds as texts. What is not known is written and read as the last of its kind.

const char *ProtectTypeText(Entry::ProtectType type) {
  if (type == Entry::PROTECT_NONE) return SZK_PROTECT_PROTECT_NONE;
  if (type == Entry::PROTECT_PASSWORD) return SZK_PROTECT_PROTECT_PASSWORD;
  return SZK_PROTECT_PROTECT_USER;
}

Entry::ProtectType ProtectTypeOf(const std::string &text) {
  if (text == SZK_PROTECT_PROTECT_NONE) return Entry::PROTECT_NONE;
  if (text == SZK_PROTECT_PROTECT_PASSWORD) return Entry::PROTECT_PASSWORD;
  return Entry::PROTECT_USER;
}

const char *AlgorithmText(Entry::PasswordEncryptAlgo algo) {
  return algo == Entry::ENCRYPT_ALGO_DEFAULT ? SZK_PROTECT_PASSWORD_ALGO_DEFAULT
                                             : SZK_PROTECT_PASSWORD_ALGO_MD5;
}

Entry::PasswordEncryptAlgo AlgorithmOf(const std::string &text) {
  return text == SZK_PROTECT_PASSWORD_ALGO_DEFAULT ? Entry::ENCRYPT_ALGO_DEFAULT
                                                   : Entry::ENCRYPT_ALGO_MD5;
}

const char *RedirectTypeText(Entry::RedirectType type) {
  if (type == Entry::REDIRECT_NONE) return SZK_REDIRECT_REDIRECT_NONE;
  if (type == Entry::REDIRECT_URLPARAM) return SZK_REDIRECT_REDIRECT_URLPARAM;
  return SZK_REDIRECT_REDIRECT_ALWAYS;
}

Entry::RedirectType RedirectTypeOf(const std::string &text) {
  if (text == SZK_REDIRECT_REDIRECT_NONE) return Entry::REDIRECT_NONE;
  if (text == SZK_REDIRECT_REDIRECT_URLPARAM) return Entry::REDIRECT_URLPARAM;
  return Entry::REDIRECT_ALWAYS;
}

// Members of stored JSON. An absent or null one gives the empty value; one of another type throws
// Json::LogicError, which ends the load.

void Require(bool condition, const char *key) {
  if (!condition) Json::throwLogicError(std::string("unexpected type of ") + key);
}

std::string TextMember(const Json::Value &data, const char *key) {
  const Json::Value &member = data[key];
  Require(member.isNull() || member.isString(), key);
  return member.asString();
}

bool BoolMember(const Json::Value &data, const char *key) {
  const Json::Value &member = data[key];
  Require(member.isNull() || member.isBool(), key);
  return member.asBool();
}

const Json::Value &ArrayMember(const Json::Value &data, const char *key) {
  const Json::Value &member = data[key];
  Require(member.isNull() || member.isArray(), key);
  return member;
}

void Load(std::vector<unsigned int> &items, const Json::Value &data, const char *key) {
  items.clear();
  for (const Json::Value &item : ArrayMember(data, key)) {
    Require(item.isUInt(), key);
    items.push_back(item.asUInt());
  }
}

void Load(std::vector<std::string> &items, const Json::Value &data, const char *key) {
  items.clear();
  for (const Json::Value &item : ArrayMember(data, key)) {
    Require(item.isString(), key);
    items.push_back(item.asString());
  }
}

/// Takes the member out, for it may be large. An absent one gives the empty value of a type.
Json::Value TakeMember(Json::Value &data, const char *key, Json::ValueType absent) {
  Json::Value member(absent);
  data.removeMember(key, &member);
  return member;
}

}  // namespace

EntryPrivate::EntryPrivate(EntryPrivate &&other)
    : hash_(std::move(other.hash_)),
      project_name_(std::move(other.project_name_)),
      protect_title_(std::move(other.protect_title_)),
      protect_password_(std::move(other.protect_password_)),
      protect_password_salt_(std::move(other.protect_password_salt_)),
      protect_uids_(std::move(other.protect_uids_)),
      protect_extra_users_(std::move(other.protect_extra_users_)),
      protect_gids_(std::move(other.protect_gids_)),
      protect_extra_groups_(std::move(other.protect_extra_groups_)),
      redirect_uri_(std::move(other.redirect_uri_)) {
  CopyPlainFields(other);
}

EntryPrivate &EntryPrivate::operator=(EntryPrivate &&other) {
  if (this == &other) return *this;
  CopyPlainFields(other);
  hash_.swap(other.hash_);
  project_name_.swap(other.project_name_);
  protect_title_.swap(other.protect_title_);
  protect_password_.swap(other.protect_password_);
  protect_password_salt_.swap(other.protect_password_salt_);
  protect_uids_ = std::move(other.protect_uids_);
  protect_extra_users_ = std::move(other.protect_extra_users_);
  protect_gids_ = std::move(other.protect_gids_);
  protect_extra_groups_ = std::move(other.protect_extra_groups_);
  redirect_uri_.swap(other.redirect_uri_);
  return *this;
}

void EntryPrivate::CopyPlainFields(const EntryPrivate &other) {
  blValid_ = other.blValid_;
  id_ = other.id_;
  enabled_ = other.enabled_;
  owner_uid_ = other.owner_uid_;
  start_at_ = other.start_at_;
  expire_at_ = other.expire_at_;
  expire_times_ = other.expire_times_;
  use_count_ = other.use_count_;
  auto_gc_ = other.auto_gc_;
  enable_match_ip_ = other.enable_match_ip_;
  protect_type_ = other.protect_type_;
  protect_password_algo_ = other.protect_password_algo_;
  redirect_type_ = other.redirect_type_;
  app_ = other.app_;
  private_data_ = other.private_data_;
}

std::vector<std::string> EntryPrivate::GetFieldList() const {
  std::vector<std::string> list = {hash_,
                                   project_name_,
                                   ToString(enabled_),
                                   std::to_string(owner_uid_),
                                   ToString(start_at_),
                                   ToString(expire_at_),
                                   ToString(expire_times_),
                                   ToString(use_count_),
                                   ToString(auto_gc_)};
  list.push_back(internal::CompactJson(DataToJson()));  // moved: it may be large
  return list;
}

std::map<std::string, std::string> EntryPrivate::GetFieldMap() const {
  return internal::FieldMap(
      std::array{SZK_HASH, SZK_PROJECT_NAME, SZK_ENABLED_, SZK_OWNER_UID, SZK_START_AT,
                 SZK_EXPIRE_AT, SZK_EXPIRE_TIMES, SZK_USE_COUNT, SZK_AUTO_GC, SZK_DATA},
      GetFieldList());
}

bool EntryPrivate::FromRow(const db::Row &row) {
  id_ = row.GetField(SZK_ID_).AsInt(0);
  hash_ = row.GetField(SZK_HASH).AsString("");
  project_name_ = row.GetField(SZK_PROJECT_NAME).AsString("");
  enabled_ = row.GetField(SZK_ENABLED_).AsBool(true);
  owner_uid_ = row.GetField(SZK_OWNER_UID).AsUInt(UID_ERR);
  start_at_ = row.GetField(SZK_START_AT).AsTime(0);
  expire_at_ = row.GetField(SZK_EXPIRE_AT).AsTime(0);
  expire_times_ = row.GetField(SZK_EXPIRE_TIMES).AsInt(0);
  use_count_ = row.GetField(SZK_USE_COUNT).AsInt(0);
  auto_gc_ = row.GetField(SZK_AUTO_GC).AsInt(0) != 0;

  Json::Value data;
  if (!internal::ParseJson(row.GetField(SZK_DATA).AsString(""), data, true)) return false;
  if (!data.isObject()) return false;
  try {
    DataFromJson(data);
  } catch (const Json::Exception &) {
    return false;
  }
  return IsLegal();
}

Json::Value EntryPrivate::DataToJson() const {
  Json::Value data(Json::objectValue);
  data[SZK_ENABLE_MATCH_IP] = enable_match_ip_;
  data[SZK_PROTECT_TYPE] = ProtectTypeText(protect_type_);
  data[SZK_PROTECT_TITLE] = protect_title_;
  data[SZK_PROTECT_PASSWORD] = protect_password_;
  data[SZK_PROTECT_PASSWORD_ALGO] = AlgorithmText(protect_password_algo_);
  data[SZK_PROTECT_PASSWORD_SALT] = protect_password_salt_;
  data[SZK_PROTECT_UIDS] = JsonArray(protect_uids_);
  data[SZK_PROTECT_EXTRA_USERS] = JsonArray(protect_extra_users_);
  data[SZK_PROTECT_GIDS] = JsonArray(protect_gids_);
  data[SZK_PROTECT_EXTRA_GROUPS] = JsonArray(protect_extra_groups_);
  data[SZK_REDIRECT_TYPE] = RedirectTypeText(redirect_type_);
  data[SZK_REDIRECT_URI] = redirect_uri_;
  data[SZK_APP] = app_;
  data[SZK_PRIVATE_DATA] = private_data_;
  return data;
}

void EntryPrivate::DataFromJson(Json::Value &data) {
  enable_match_ip_ = BoolMember(data, SZK_ENABLE_MATCH_IP);
  protect_type_ = ProtectTypeOf(TextMember(data, SZK_PROTECT_TYPE));
  protect_title_ = TextMember(data, SZK_PROTECT_TITLE);
  protect_password_ = TextMember(data, SZK_PROTECT_PASSWORD);
  protect_password_algo_ = AlgorithmOf(TextMember(data, SZK_PROTECT_PASSWORD_ALGO));
  protect_password_salt_ = TextMember(data, SZK_PROTECT_PASSWORD_SALT);
  Load(protect_uids_, data, SZK_PROTECT_UIDS);
  Load(protect_extra_users_, data, SZK_PROTECT_EXTRA_USERS);
  Load(protect_gids_, data, SZK_PROTECT_GIDS);
  Load(protect_extra_groups_, data, SZK_PROTECT_EXTRA_GROUPS);
  redirect_type_ = RedirectTypeOf(TextMember(data, SZK_REDIRECT_TYPE));
  redirect_uri_ = TextMember(data, SZK_REDIRECT_URI);
  app_ = TakeMember(data, SZK_APP, Json::nullValue);
  private_data_ = TakeMember(data, SZK_PRIVATE_DATA, Json::objectValue);
}

}  // namespace VELK::sharing::record
