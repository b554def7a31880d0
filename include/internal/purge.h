#ifndef VELKSHARING_INTERNAL_PURGE_H
#define VELKSHARING_INTERNAL_PURGE_H

#include <string>

#include "velksharing/database.h"

namespace VELK::sharing::internal {

/// With the given probability, deletes the rows of `table` whose time-out lies before this second.
/// @return false when the statement failed; a draw that misses is no failure.
bool PurgeLapsed(db::BaseDB &db, const std::string &table, float probability);

}  // namespace VELK::sharing::internal

#endif
