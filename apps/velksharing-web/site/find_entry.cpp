#include "site/find_entry.h"

#include <velksharing/database.h>
#include <velksharing/store.h>

namespace web {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

EntryPointer FindEntry(const std::string &hash) {
  auto entry = std::make_unique<Entry>();
  if (!EntryDB(SharingDB::Instance()).GetByHash(hash, *entry)) return nullptr;
  return entry;
}

}  // namespace web
