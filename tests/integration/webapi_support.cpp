#include "integration/webapi_support.h"

#include <json/reader.h>

#include <memory>

#include "velk_paths.h"

namespace velk_test {

Outcome WebApi::RunWebApi(Arguments arguments, const std::string &input) {
  arguments.insert(arguments.begin(), VELK_ROOT "/bin/velkwebapi");
  return RunProgram(arguments, input);
}

Json::Value WebApi::Ask(const std::string &api, const std::string &method,
                        const Arguments &parameters, const std::string &input) {
  Arguments arguments = {"--exec", "api=" + api, "version=1", "method=" + method};
  arguments.insert(arguments.end(), parameters.begin(), parameters.end());
  const Outcome outcome = RunWebApi(arguments, input);
  EXPECT_EQ(0, outcome.status) << outcome.err;
  Json::CharReaderBuilder builder;
  Json::CharReaderBuilder::strictMode(&builder.settings_);
  const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
  Json::Value document;
  std::string errors;
  EXPECT_TRUE(reader->parse(outcome.out.data(), outcome.out.data() + outcome.out.size(), &document,
                            &errors))
      << errors << outcome.out;
  EXPECT_EQ(outcome.out.size() - 1, outcome.out.find('\n')) << "one line: " << outcome.out;
  return document;
}

Json::Value WebApi::Data(const std::string &api, const std::string &method,
                         const Arguments &parameters, const std::string &input) {
  const Json::Value answer = Ask(api, method, parameters, input);
  EXPECT_TRUE(answer["success"].asBool()) << answer;
  EXPECT_FALSE(answer.isMember("error")) << answer;
  return answer["data"];
}

Json::Value WebApi::Error(const std::string &api, const std::string &method,
                          const Arguments &parameters, const std::string &input) {
  const Json::Value answer = Ask(api, method, parameters, input);
  EXPECT_FALSE(answer["success"].asBool()) << answer;
  EXPECT_FALSE(answer.isMember("data")) << answer;
  return answer["error"];
}

}  // namespace velk_test
