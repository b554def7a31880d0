#include "record/entry_data.h"

#include <utility>

#include "internal/json.h"
#include "velksharing/constants.h"

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

EntryData::EntryData(EntryData &&other)
    : protect_title_(std::move(other.protect_title_)),
      protect_password_(std::move(other.protect_password_)),
      protect_password_salt_(std::move(other.protect_password_salt_)),
      protect_uids_(std::move(other.protect_uids_)),
      protect_extra_users_(std::move(other.protect_extra_users_)),
      protect_gids_(std::move(other.protect_gids_)),
      protect_extra_groups_(std::move(other.protect_extra_groups_)),
      redirect_uri_(std::move(other.redirect_uri_)) {
  CopyPlainFields(other);
}

EntryData &EntryData::operator=(EntryData &&other) {
  if (this == &other) return *this;
  CopyPlainFields(other);
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

void EntryData::CopyPlainFields(const EntryData &other) {
  enable_match_ip_ = other.enable_match_ip_;
  protect_type_ = other.protect_type_;
  protect_password_algo_ = other.protect_password_algo_;
  redirect_type_ = other.redirect_type_;
  app_ = other.app_;
  private_data_ = other.private_data_;
}

Json::Value EntryData::ToJson() const {
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

void EntryData::FromJson(Json::Value &data) {
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

bool EntryData::Parse(const std::string &text) {
  Json::Value data;
  if (!internal::ParseJson(text, data, true) || !data.isObject()) return false;
  try {
    FromJson(data);
  } catch (const Json::Exception &) {
    return false;
  }
  return true;
}

std::string EntryData::Text() const {
  return internal::CompactJson(ToJson());
}

}  // namespace VELK::sharing::record
