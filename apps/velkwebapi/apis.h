#ifndef VELKWEBAPI_APIS_H
#define VELKWEBAPI_APIS_H

#include <vector>

#include "api.h"

namespace webapi {

/// All that there is.
const std::vector<Api> &Apis();

// One API each.
Api InfoApi();
Api LinkApi();
Api SessionApi();
Api BlockApi();

/// Renames the member of a list's JSON form that holds its rows to "items": in the web API all
/// lists are read alike.
Json::Value WithItems(Json::Value list, const char *rows);

}  // namespace webapi

#endif
