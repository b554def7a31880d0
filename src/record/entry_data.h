#ifndef VELKSHARING_RECORD_ENTRY_DATA_H
#define VELKSHARING_RECORD_ENTRY_DATA_H

#include <json/value.h>

#include <string>
#include <vector>

#include "velksharing/record.h"

namespace VELK::sharing::record {

/// What a link keeps as JSON, in the column `data`.
struct EntryData {
  EntryData() = default;
  EntryData(const EntryData &other) = default;
  /// Takes texts and lists, copies the rest.
  EntryData(EntryData &&other);
  EntryData &operator=(const EntryData &other) = default;
  /// Exchanges texts, takes lists, copies the rest.
  EntryData &operator=(EntryData &&other);
  ~EntryData() = default;

  /// Takes what the column says.
  /// @return false when it is no JSON object, or a member has another type. Then some members may
  ///         be taken already.
  bool Parse(const std::string &text);
  /// The column's new text.
  std::string Text() const;

  bool enable_match_ip_ = true;
  Entry::ProtectType protect_type_ = Entry::PROTECT_NONE;
  std::string protect_title_;
  std::string protect_password_;
  std::string protect_password_salt_;
  Entry::PasswordEncryptAlgo protect_password_algo_ = Entry::ENCRYPT_ALGO_DEFAULT;
  std::vector<unsigned int> protect_uids_;
  std::vector<std::string> protect_extra_users_;  ///< Permitted, but without a uid when set.
  std::vector<unsigned int> protect_gids_;
  std::vector<std::string> protect_extra_groups_;  ///< Permitted, but without a gid when set.
  Entry::RedirectType redirect_type_ = Entry::REDIRECT_NONE;
  std::string redirect_uri_;
  Json::Value app_;  ///< Null at first: the application has to set it.
  Json::Value private_data_{Json::objectValue};

 private:
  void CopyPlainFields(const EntryData &other);
  Json::Value ToJson() const;
  /// Takes what it can use out of `data`. Throws Json::LogicError for members of other types.
  void FromJson(Json::Value &data);
};

}  // namespace VELK::sharing::record

#endif
