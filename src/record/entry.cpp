#include "velksharing/record.h"

#include <climits>

#include "record/entry_private.h"

namespace VELK::sharing::record {

Entry::Entry() : private_(std::make_unique<EntryPrivate>()) {}
Entry::Entry(const Entry &other) : private_(std::make_unique<EntryPrivate>(*other.private_)) {}
Entry::Entry(Entry &&other)
    : private_(std::make_unique<EntryPrivate>(std::move(*other.private_))) {}
Entry &Entry::operator=(const Entry &other) {
  *private_ = *other.private_;
  return *this;
}
Entry &Entry::operator=(Entry &&other) {
  *private_ = std::move(*other.private_);
  return *this;
}
Entry::~Entry() = default;

Object &Entry::GetObject() {
  return *private_;
}
const Object &Entry::GetCObject() const {
  return *private_;
}

std::vector<std::string> Entry::GetFieldList() const {
  return private_->GetFieldList();
}
std::map<std::string, std::string> Entry::GetFieldMap() const {
  return private_->GetFieldMap();
}
bool Entry::IsLegal() const {
  return private_->IsLegal();
}
bool Entry::IsValid() const {
  return private_->IsValid();
}
bool Entry::IsPasswordValid(const std::string &password) const {
  return private_->IsPasswordValid(password);
}
void Entry::ToJSON(Json::Value &out) const {
  private_->ToJSON(out);
}
bool Entry::FromRow(const db::Row &row) {
  return private_->FromRow(row);
}

int Entry::get_id() const {
  return private_->id_;
}
Entry &Entry::set_id(int id) {
  private_->id_ = id;
  return *this;
}

std::string Entry::get_hash() const {
  return private_->hash_;
}
Entry &Entry::set_hash(std::string hash) {
  private_->hash_ = std::move(hash);
  return *this;
}

std::string Entry::get_project_name() const {
  return private_->project_name_;
}
Entry &Entry::set_project_name(const std::string &project_name) {
  private_->project_name_ = project_name;
  return *this;
}

bool Entry::get_enabled() const {
  return private_->enabled_;
}
Entry &Entry::set_enabled(const bool &enabled) {
  private_->enabled_ = enabled;
  return *this;
}

unsigned int Entry::get_owner_uid() const {
  return private_->owner_uid_;
}
Entry &Entry::set_owner_uid(unsigned int owner_uid) {
  private_->owner_uid_ = owner_uid;
  return *this;
}

std::string Entry::get_owner_user() const {
  return private_->get_owner_user();
}
Entry &Entry::set_owner_user(const std::string &owner_user) {
  private_->set_owner_user(owner_user);
  return *this;
}

long Entry::get_start_at() const {
  return private_->start_at_;
}
Entry &Entry::set_start_at(long start_at) {
  private_->start_at_ = start_at;
  return *this;
}

long Entry::get_expire_at() const {
  return private_->expire_at_;
}
Entry &Entry::set_expire_at(long expire_at) {
  private_->expire_at_ = expire_at;
  return *this;
}

std::string Entry::get_start_at_str(const char *format) const {
  return private_->get_start_at_str(format);
}
Entry &Entry::set_start_at_str(const std::string &text, const char *format) {
  private_->set_start_at_str(text, format);
  return *this;
}

std::string Entry::get_expire_at_str(const char *format) const {
  return private_->get_expire_at_str(format);
}
Entry &Entry::set_expire_at_str(const std::string &text, const char *format) {
  private_->set_expire_at_str(text, format);
  return *this;
}

int Entry::get_expire_times() const {
  return private_->expire_times_;
}
Entry &Entry::set_expire_times(const int &expire_times) {
  private_->set_expire_times(expire_times);
  return *this;
}

int Entry::get_use_count() const {
  return private_->use_count_;
}
Entry &Entry::set_use_count(const int &use_count) {
  private_->use_count_ = use_count;
  return *this;
}

Entry &Entry::inc_use_count() {
  if (private_->use_count_ < INT_MAX) ++private_->use_count_;
  return *this;
}

bool Entry::get_auto_gc() const {
  return private_->auto_gc_;
}
Entry &Entry::set_auto_gc(const bool &auto_gc) {
  private_->auto_gc_ = auto_gc;
  return *this;
}

bool Entry::get_enable_match_ip() const {
  return private_->enable_match_ip_;
}
Entry &Entry::set_enable_match_ip(bool enable_match_ip) {
  private_->enable_match_ip_ = enable_match_ip;
  return *this;
}

Entry::ProtectType Entry::get_protect_type() const {
  return private_->protect_type_;
}
Entry &Entry::set_protect_type(Entry::ProtectType protect_type) {
  private_->protect_type_ = protect_type;
  return *this;
}

std::string Entry::get_protect_title() const {
  return private_->protect_title_;
}
Entry &Entry::set_protect_title(const std::string &protect_title) {
  private_->protect_title_ = protect_title;
  return *this;
}

std::string Entry::get_protect_password() const {
  return private_->protect_password_;
}
Entry::PasswordEncryptAlgo Entry::get_protect_password_algo() const {
  return private_->protect_password_algo_;
}
std::string Entry::get_protect_password_salt() const {
  return private_->protect_password_salt_;
}
Entry &Entry::set_protect_password(const std::string &password, bool hash,
                                   Entry::PasswordEncryptAlgo algo) {
  private_->set_protect_password(password, hash, algo);
  return *this;
}

std::vector<unsigned int> Entry::get_protect_uids() const {
  return private_->get_protect_uids();
}
Entry &Entry::set_protect_uids(const std::vector<unsigned int> &protect_uids) {
  private_->set_protect_uids(protect_uids);
  return *this;
}

std::vector<unsigned int> Entry::get_protect_gids() const {
  return private_->get_protect_gids();
}
Entry &Entry::set_protect_gids(const std::vector<unsigned int> &protect_gids) {
  private_->set_protect_gids(protect_gids);
  return *this;
}

std::vector<std::string> Entry::get_protect_users() const {
  return private_->get_protect_users();
}
Entry &Entry::set_protect_users(const std::vector<std::string> &protect_users) {
  private_->set_protect_users(protect_users);
  return *this;
}

std::vector<std::string> Entry::get_protect_groups() const {
  return private_->get_protect_groups();
}
Entry &Entry::set_protect_groups(const std::vector<std::string> &protect_groups) {
  private_->set_protect_groups(protect_groups);
  return *this;
}

Entry::RedirectType Entry::get_redirect_type() const {
  return private_->redirect_type_;
}
Entry &Entry::set_redirect_type(Entry::RedirectType redirect_type) {
  private_->redirect_type_ = redirect_type;
  return *this;
}

std::string Entry::get_redirect_uri() const {
  return private_->redirect_uri_;
}
Entry &Entry::set_redirect_uri(const std::string &redirect_uri) {
  private_->redirect_uri_ = redirect_uri;
  return *this;
}

Json::Value Entry::get_app() const {
  return private_->app_;
}
Entry &Entry::set_app(const Json::Value &app) {
  private_->app_ = app;
  return *this;
}

Json::Value Entry::get_private_data() const {
  return private_->private_data_;
}
Entry &Entry::set_private_data(const Json::Value &private_data) {
  private_->private_data_ = private_data;
  return *this;
}

}  // namespace VELK::sharing::record
