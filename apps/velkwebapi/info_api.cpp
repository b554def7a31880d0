#include "apis.h"
#include "errors.h"

namespace webapi {
namespace {

Json::Value ParameterToJson(const Parameter &parameter) {
  Json::Value json(Json::objectValue);
  json["name"] = parameter.name;
  json["type"] = TypeName(parameter.type);
  json["required"] = parameter.presence == REQUIRED;
  json["description"] = parameter.description;
  if (parameter.type == INTEGER || parameter.type == DESCRIPTOR) {
    json["lowest"] = static_cast<Json::Int64>(parameter.lowest);
    json["highest"] = static_cast<Json::Int64>(parameter.highest);
  }
  for (const std::string &choice : parameter.choices) json["choices"].append(choice);
  return json;
}

Json::Value MethodToJson(const Method &method) {
  Json::Value json(Json::objectValue);
  json["method"] = method.name;
  json["description"] = method.description;
  json["parameters"] = Json::arrayValue;
  for (const Parameter &parameter : method.parameters)
    json["parameters"].append(ParameterToJson(parameter));
  return json;
}

Json::Value ApiToJson(const Api &api) {
  Json::Value json(Json::objectValue);
  json["api"] = api.name;
  json["version"] = api.version;
  for (const Method &method : api.methods) json["methods"].append(MethodToJson(method));
  return json;
}

Json::Value ErrorToJson(const ErrorDescription &error) {
  Json::Value json(Json::objectValue);
  json["code"] = error.code;
  json["name"] = error.name;
  json["meaning"] = error.meaning;
  return json;
}

Json::Value Query(Parameters &) {
  Json::Value data(Json::objectValue);
  for (const Api &api : Apis()) data["apis"].append(ApiToJson(api));
  for (const ErrorDescription &error : kErrors) data["errors"].append(ErrorToJson(error));
  return data;
}

}  // namespace

Api InfoApi() {
  return {"VELK.API.Info",
          1,
          {{"query", "Tells which APIs, versions, methods and errors there are.", {}, Query}}};
}

}  // namespace webapi
