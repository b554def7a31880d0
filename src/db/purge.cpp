#include "internal/purge.h"

#include <ctime>

#include "velksharing/utils.h"

namespace VELK::sharing::internal {

bool PurgeLapsed(db::BaseDB &db, const std::string &table, float probability) {
  if (!IsProbabilityHit(probability)) return true;
  return db.Execute("DELETE FROM " + table + " WHERE timeout < '" + std::to_string(time(nullptr)) +
                    "'");
}

}  // namespace VELK::sharing::internal
