#include "apis.h"

namespace webapi {

const std::vector<Api> &Apis() {
  static const std::vector<Api> apis = {InfoApi(), LinkApi(), SessionApi(), BlockApi()};
  return apis;
}

Json::Value WithItems(Json::Value list, const char *rows) {
  Json::Value items;
  list.removeMember(rows, &items);
  list["items"] = std::move(items);
  return list;
}

}  // namespace webapi
