#ifndef VELKSHARING_RECORD_ENTRY_PRIVATE_H
#define VELKSHARING_RECORD_ENTRY_PRIVATE_H

#include <string>
#include <vector>

#include "record/entry_data.h"
#include "velksharing/constants.h"
#include "velksharing/record.h"

namespace VELK::sharing::record {

/// All that a link is. entry_private.cpp holds its stored form, entry_rules.cpp its rules, and
/// entry_data.cpp what one column keeps for it.
class EntryPrivate : public Object, public EntryData {
 public:
  EntryPrivate() = default;
  EntryPrivate(const EntryPrivate &other) = default;
  /// Takes texts and lists, copies the rest.
  EntryPrivate(EntryPrivate &&other);
  EntryPrivate &operator=(const EntryPrivate &other) = default;
  /// Exchanges texts, takes lists, copies the rest.
  EntryPrivate &operator=(EntryPrivate &&other);
  ~EntryPrivate() override = default;

  std::vector<std::string> GetFieldList() const override;
  std::map<std::string, std::string> GetFieldMap() const override;
  bool IsLegal() const override;
  void ToJSON(Json::Value &out) const override;
  bool FromRow(const db::Row &row) override;
  int get_id() const override { return id_; }
  void set_id(int id) override { id_ = id; }

  bool IsValid() const;
  bool IsPasswordValid(const std::string &password) const;

  void set_expire_times(int expire_times);
  void set_protect_password(const std::string &password, bool hash,
                            Entry::PasswordEncryptAlgo algo);

  std::string get_owner_user() const;
  bool set_owner_user(const std::string &name);

  std::string get_start_at_str(const char *format) const;
  std::string get_expire_at_str(const char *format) const;
  long set_start_at_str(const std::string &text, const char *format);
  long set_expire_at_str(const std::string &text, const char *format);

  std::vector<unsigned int> get_protect_uids() const;
  void set_protect_uids(const std::vector<unsigned int> &uids);
  std::vector<unsigned int> get_protect_gids() const;
  void set_protect_gids(const std::vector<unsigned int> &gids);
  std::vector<std::string> get_protect_users() const;
  void set_protect_users(const std::vector<std::string> &names);
  std::vector<std::string> get_protect_groups() const;
  void set_protect_groups(const std::vector<std::string> &names);

  bool blValid_ = true;  ///< False while the last set_protect_password() failed.
  int id_ = 0;
  std::string hash_;
  std::string project_name_;
  bool enabled_ = true;
  unsigned int owner_uid_ = UID_ERR;
  long start_at_ = 0;
  long expire_at_ = 0;
  int expire_times_ = 0;
  int use_count_ = 0;
  bool auto_gc_ = true;

 private:
  void CopyPlainFields(const EntryPrivate &other);
};

}  // namespace VELK::sharing::record

#endif
