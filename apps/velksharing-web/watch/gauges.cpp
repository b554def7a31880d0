#include "watch/gauges.h"

#include <velk/velksdk.h>
#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <ctime>
#include <string>

namespace web::watch {
namespace {

using VELK::sharing::SZK_TIMEOUT;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::db::TokenDB;

template <typename Store>
std::optional<int> CountLive(SharingDB &database) {
  const Store store(database);
  store.GetCondition().Where(std::string(SZK_TIMEOUT) + " > " + std::to_string(time(nullptr)));
  int count = 0;
  return store.Count(count) ? std::optional(count) : std::nullopt;
}

int CountBlocked(const VELKAutoBlockRecord *record, void *count) {
  if (record->blocked == 1) ++*static_cast<int *>(count);
  return 0;
}

}  // namespace

GaugeReader::GaugeReader() = default;

GaugeReader::~GaugeReader() = default;

Gauges GaugeReader::Read() {
  Gauges gauges;
  ReadDatabase(gauges);
  int blocked = 0;
  if (VELKAutoBlockList(&CountBlocked, &blocked) == 0) gauges.blocked_addresses = blocked;
  return gauges;
}

void GaugeReader::ReadDatabase(Gauges &gauges) {
  if (database_ == nullptr) database_ = std::make_unique<SharingDB>();
  if (database_->IsGood()) {
    gauges.sessions = CountLive<SessionDB>(*database_);
    gauges.grants = CountLive<TokenDB>(*database_);
  }
  gauges.is_database_up = gauges.sessions && gauges.grants;
  if (!gauges.is_database_up) database_.reset();
}

}  // namespace web::watch
