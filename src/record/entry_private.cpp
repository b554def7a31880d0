#include "record/entry_private.h"

#include <array>
#include <utility>

#include "internal/field_map.h"
#include "record/read_entry_data.h"
#include "velksharing/database.h"
#include "velksharing/utils.h"

namespace VELK::sharing::record {

EntryPrivate::EntryPrivate(EntryPrivate &&other)
    : EntryData(std::move(other)),
      hash_(std::move(other.hash_)),
      project_name_(std::move(other.project_name_)) {
  CopyPlainFields(other);
}

EntryPrivate &EntryPrivate::operator=(EntryPrivate &&other) {
  if (this == &other) return *this;
  EntryData::operator=(std::move(other));
  CopyPlainFields(other);
  hash_.swap(other.hash_);
  project_name_.swap(other.project_name_);
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
  list.push_back(Text());  // moved: it may be large
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

  return ReadEntryData(row.GetField(SZK_DATA).AsString(""), *this) && IsLegal();
}

}  // namespace VELK::sharing::record
