#include "internal/json.h"
#include "internal/log.h"
#include "internal/popen.h"
#include "velk_paths.h"
#include "velksharing/utils.h"

namespace VELK::sharing {
namespace {

using internal::LogError;
using internal::ParseJson;
using internal::PipeReader;

constexpr char kSource[] = "utils_send_webapi";
constexpr char kProgram[] = VELK_ROOT "/bin/velkwebapi";

std::vector<std::string> Arguments(const std::string &api, int version, const std::string &method,
                                   const Json::Value &params) {
  std::vector<std::string> arguments = {"velkwebapi", "--exec", "api=" + api,
                                        "version=" + ToString(version), "method=" + method};
  for (const std::string &name : params.getMemberNames()) {
    arguments.push_back(name + "=" + params[name].asString());
  }
  return arguments;
}

}  // namespace

bool SendWebapi(Json::Value &out, const std::string &api, int version, const std::string &method,
                const Json::Value &params) {
  out = Json::Value(Json::objectValue);
  PipeReader file(kProgram, Arguments(api, version, method, params));
  if (file.file == nullptr) {
    LogError(kSource, "%s:%d (%u) popen failed\n\n");
    return false;
  }
  std::string reply;
  if (file.ReadToEnd(reply) && ParseJson(reply, out, false)) return true;
  LogError(kSource, "%s:%d (%u) json read failed\n\n");
  return false;
}

}  // namespace VELK::sharing
