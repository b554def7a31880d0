#include <openssl/crypto.h>

#include <ctime>

#include "internal/json.h"
#include "internal/log.h"
#include "record/entry_private.h"
#include "velk/velkrandom.h"
#include "velksharing/utils.h"

namespace VELK::sharing::record {
namespace {

constexpr char kSource[] = "entry";
constexpr char kJsonTimeFormat[] = "%Y-%m-%d %H:%M:%S";

bool Digest(const std::string &password, Entry::PasswordEncryptAlgo algo, const std::string &salt,
            std::string &digest) {
  return algo == Entry::ENCRYPT_ALGO_DEFAULT ? Sha1WithSaltHashPassword(password, salt, digest)
                                             : MD5HashPassword(password, digest);
}

bool SameInConstantTime(const std::string &one, const std::string &other) {
  return one.size() == other.size() && CRYPTO_memcmp(one.data(), other.data(), one.size()) == 0;
}

bool LocalTime(time_t seconds, tm &broken_down) {
  tzset();  // localtime_r() itself need not follow a change of TZ
  return localtime_r(&seconds, &broken_down) != nullptr;
}

std::string TimeText(long seconds, const char *format) {
  tm broken_down{};
  if (seconds == 0 || format == nullptr || !LocalTime(seconds, broken_down)) return "";
  char text[128];
  return std::string(text, strftime(text, sizeof text, format, &broken_down));
}

long TimeOf(const std::string &text, const char *format) {
  tm today{};
  LocalTime(time(nullptr), today);
  if (text.empty() || format == nullptr) return 0;
  tm broken_down{};
  if (strptime(text.c_str(), format, &broken_down) == nullptr) return 0;
  broken_down.tm_isdst = today.tm_isdst;
  return mktime(&broken_down);
}

using NameToId = bool (*)(const std::string &name, unsigned int &id);
using IdToName = bool (*)(const unsigned int &id, std::string &name);

/// The ids, and those of the names that have one now.
std::vector<unsigned int> Ids(std::vector<unsigned int> ids, const std::vector<std::string> &names,
                              NameToId find) {
  for (const std::string &name : names) {
    unsigned int id = 0;
    if (find(name, id)) ids.push_back(id);
  }
  return ids;
}

/// The names of the ids that have one now, and the names.
std::vector<std::string> Names(const std::vector<unsigned int> &ids,
                               const std::vector<std::string> &names, IdToName find) {
  std::vector<std::string> all;
  for (unsigned int id : ids) {
    std::string name;
    if (find(id, name)) all.push_back(name);
  }
  all.insert(all.end(), names.begin(), names.end());
  return all;
}

/// Sorts names into the ids of those that are known and the others.
void Resolve(const std::vector<std::string> &names, NameToId find, std::vector<unsigned int> &ids,
             std::vector<std::string> &unknown) {
  ids.clear();
  unknown.clear();
  for (const std::string &name : names) {
    unsigned int id = 0;
    if (find(name, id)) {
      ids.push_back(id);
    } else {
      unknown.push_back(name);
    }
  }
}

// Kinds as texts for callers. What is not known shows as "none" here, unlike in the stored form.

const char *ShownProtectType(Entry::ProtectType type) {
  if (type == Entry::PROTECT_PASSWORD) return SZK_PROTECT_PROTECT_PASSWORD;
  if (type == Entry::PROTECT_USER) return SZK_PROTECT_PROTECT_USER;
  return SZK_PROTECT_PROTECT_NONE;
}

const char *ShownRedirectType(Entry::RedirectType type) {
  if (type == Entry::REDIRECT_URLPARAM) return SZK_REDIRECT_REDIRECT_URLPARAM;
  if (type == Entry::REDIRECT_ALWAYS) return SZK_REDIRECT_REDIRECT_ALWAYS;
  return SZK_REDIRECT_REDIRECT_NONE;
}

}  // namespace

// The text of each condition is what the log shows, to the blank.
// clang-format off
bool EntryPrivate::IsLegal() const {
  VELK_REFUSE_IF(kSource, !blValid_);
  VELK_REFUSE_IF(kSource, "" == hash_);
  VELK_REFUSE_IF(kSource, "" == project_name_);
  VELK_REFUSE_IF(kSource, UID_ERR == owner_uid_);
  VELK_REFUSE_IF(kSource, ! app_.isObject());
  VELK_REFUSE_IF(kSource, ! private_data_.isObject());
  VELK_REFUSE_IF(kSource, Entry::PROTECT_PASSWORD == protect_type_ && "" == protect_password_);
  VELK_REFUSE_IF(kSource, Entry::PROTECT_PASSWORD == protect_type_ &&
                              Entry::ENCRYPT_ALGO_DEFAULT == protect_password_algo_ &&
                              "" == protect_password_salt_);
  VELK_REFUSE_IF(kSource, Entry::PROTECT_USER == protect_type_ &&
                              (0 == protect_uids_.size() + protect_extra_users_.size() +
                                        protect_gids_.size() + protect_extra_groups_.size()));
  return true;
}

bool EntryPrivate::IsValid() const {
  const time_t timeNow = time(NULL);
  VELK_REFUSE_IF(kSource, ! IsLegal());
  VELK_REFUSE_IF(kSource, ! enabled_);
  VELK_REFUSE_IF(kSource, 0 < start_at_ && start_at_ > timeNow);
  VELK_REFUSE_IF(kSource, 0 < expire_at_ && timeNow > expire_at_);
  VELK_REFUSE_IF(kSource, 0 < expire_times_ && use_count_ > expire_times_);
  return true;
}
// clang-format on

bool EntryPrivate::IsPasswordValid(const std::string &password) const {
  if (protect_type_ != Entry::PROTECT_PASSWORD) return true;
  std::string digest;
  return Digest(password, protect_password_algo_, protect_password_salt_, digest) &&
         SameInConstantTime(digest, protect_password_);
}

void EntryPrivate::set_expire_times(int expire_times) {
  const bool becomes_limited = expire_times_ == 0 && expire_times != 0;
  if (becomes_limited) use_count_ = 0;
  expire_times_ = expire_times;
}

void EntryPrivate::set_protect_password(const std::string &password, bool hash,
                                        Entry::PasswordEncryptAlgo algo) {
  blValid_ = false;
  static RANDOM::VELKRandom random;
  std::string digest;
  if (!hash) {
    digest = password;
    blValid_ = true;
  } else {
    const bool has_salt = algo != Entry::ENCRYPT_ALGO_DEFAULT ||
                          random.getString(RANDOM::POOL_ALPHA_NUMERIC, SHARING_PASS_HASH_LENGTH,
                                           protect_password_salt_);
    blValid_ = has_salt && Digest(password, algo, protect_password_salt_, digest);
  }
  protect_password_ = digest;
  protect_password_algo_ = algo;
}

std::string EntryPrivate::get_owner_user() const {
  std::string name;
  return UIDToUser(owner_uid_, name) ? name : "";
}

bool EntryPrivate::set_owner_user(const std::string &name) {
  owner_uid_ = UID_ERR;
  return UserToUID(name, owner_uid_);
}

std::string EntryPrivate::get_start_at_str(const char *format) const {
  return TimeText(start_at_, format);
}

std::string EntryPrivate::get_expire_at_str(const char *format) const {
  return TimeText(expire_at_, format);
}

long EntryPrivate::set_start_at_str(const std::string &text, const char *format) {
  return start_at_ = TimeOf(text, format);
}

long EntryPrivate::set_expire_at_str(const std::string &text, const char *format) {
  return expire_at_ = TimeOf(text, format);
}

std::vector<unsigned int> EntryPrivate::get_protect_uids() const {
  return Ids(protect_uids_, protect_extra_users_, UserToUID);
}

void EntryPrivate::set_protect_uids(const std::vector<unsigned int> &uids) {
  protect_uids_ = uids;
  protect_extra_users_.clear();
}

std::vector<unsigned int> EntryPrivate::get_protect_gids() const {
  return Ids(protect_gids_, protect_extra_groups_, GroupToGID);
}

void EntryPrivate::set_protect_gids(const std::vector<unsigned int> &gids) {
  protect_gids_ = gids;
  protect_extra_groups_.clear();
}

std::vector<std::string> EntryPrivate::get_protect_users() const {
  return Names(protect_uids_, protect_extra_users_, UIDToUser);
}

void EntryPrivate::set_protect_users(const std::vector<std::string> &names) {
  Resolve(names, UserToUID, protect_uids_, protect_extra_users_);
}

std::vector<std::string> EntryPrivate::get_protect_groups() const {
  return Names(protect_gids_, protect_extra_groups_, GIDToGroup);
}

void EntryPrivate::set_protect_groups(const std::vector<std::string> &names) {
  Resolve(names, GroupToGID, protect_gids_, protect_extra_groups_);
}

void EntryPrivate::ToJSON(Json::Value &out) const {
  out = Json::Value(Json::objectValue);
  out[SZK_HASH] = hash_;
  out[SZK_PROJECT_NAME] = project_name_;
  out[SZK_ENABLED_] = enabled_;
  out[SZK_OWNER_USER] = get_owner_user();
  out[SZK_START_AT] = get_start_at_str(kJsonTimeFormat);
  out[SZK_EXPIRE_AT] = get_expire_at_str(kJsonTimeFormat);
  out[SZK_EXPIRE_TIMES] = expire_times_;
  out[SZK_USE_COUNT] = use_count_;
  out[SZK_AUTO_GC] = auto_gc_;
  out[SZK_ENABLE_MATCH_IP] = enable_match_ip_;
  out[SZK_PROTECT_TITLE] = protect_title_;
  out[SZK_PROTECT_TYPE] = ShownProtectType(protect_type_);
  out[SZK_PROTECT_USERS] = internal::JsonArray(get_protect_users());
  out[SZK_PROTECT_GROUPS] = internal::JsonArray(get_protect_groups());
  out[SZK_REDIRECT_TYPE] = ShownRedirectType(redirect_type_);
  out[SZK_REDIRECT_URI] = redirect_uri_;
  out[SZK_APP] = app_;
}

}  // namespace VELK::sharing::record
