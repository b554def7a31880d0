#include "reply.h"

#include <json/writer.h>

#include <algorithm>
#include <exception>

#include "apis.h"
#include "errors.h"
#include "parameters.h"

namespace webapi {
namespace {

const Api &FindApi(const Request &request) {
  const std::vector<Api> &apis = Apis();
  const auto api = std::find_if(apis.begin(), apis.end(),
                                [&](const Api &known) { return known.name == request.api; });
  if (api == apis.end()) throw Refusal(UNKNOWN_API, "there is no API “" + request.api + "”");
  if (request.version != std::to_string(api->version)) {
    throw Refusal(UNKNOWN_VERSION, api->name + " has version " + std::to_string(api->version) +
                                       ", not " + request.version);
  }
  return *api;
}

const Method &FindMethod(const Api &api, const std::string &name) {
  const auto method = std::find_if(api.methods.begin(), api.methods.end(),
                                   [&](const Method &known) { return known.name == name; });
  if (method == api.methods.end())
    throw Refusal(UNKNOWN_METHOD, api.name + " has no method “" + name + "”");
  return *method;
}

Json::Value Run(const Request &request) {
  const Method &method = FindMethod(FindApi(request), request.method);
  Parameters parameters(method, request);
  return method.run(parameters);
}

Json::Value Failed(ErrorCode code, const char *message) {
  Json::Value answer(Json::objectValue);
  answer["success"] = false;
  answer["error"]["code"] = code;
  answer["error"]["message"] = message;
  return answer;
}

}  // namespace

Json::Value Answer(const Request &request) {
  try {
    Json::Value answer(Json::objectValue);
    answer["data"] = Run(request);
    answer["success"] = true;
    return answer;
  } catch (const Refusal &refusal) {
    return Failed(refusal.code(), refusal.what());
  } catch (const operations::Failure &failure) {
    return Failed(CodeOf(failure), failure.what());
  } catch (const std::exception &exception) {
    return Failed(SYSTEM_FAILED, exception.what());
  }
}

std::string ReplyText(const Json::Value &answer) {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "";
  return Json::writeString(builder, answer);
}

}  // namespace webapi
