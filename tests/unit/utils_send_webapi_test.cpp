#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>
#include <velksharing/utils.h>

#include <climits>
#include <cstdio>
#include <string>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/scripted_program.h"
#include "velk_paths.h"

namespace {

using namespace VELK::sharing;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;
using velk_test::ErrorLine;
using velk_test::LogCapture;
using velk_test::LogLine;
using velk_test::ScriptedProgram;
using velk_test::WriteFile;

/// What a call gave; `out` began as the text "before".
struct Answer {
  bool done = false;
  Json::Value out = "before";
};

Answer Ask(const Json::Value &params = Json::Value(Json::objectValue)) {
  Answer answer;
  answer.done = SendWebapi(answer.out, "VELK.API.Info", 1, "query", params);
  return answer;
}

/// The answer when the program prints `output`.
Answer AnswerTo(const std::string &output) {
  const ScriptedProgram program("cat \"$FOLDER/output\"");
  WriteFile(program.File("output"), output);
  return Ask();
}

/// The arguments behind "method=" that `params` become.
std::vector<std::string> ArgumentsOf(const Json::Value &params) {
  const ScriptedProgram program("echo {}");
  EXPECT_TRUE(Ask(params).done);
  const std::vector<std::string> &arguments = program.calls().at(0).arguments;
  return {arguments.begin() + 5, arguments.end()};
}

::testing::Matcher<const LogLine &> JsonReadFailed() {
  return ErrorLine("%s:%d (%u) json read failed\n\n",
                   "utils_send_webapi:# (@) json read failed\n\n");
}

TEST(SendWebapi, GivesTheDocumentThatTheProgramPrints) {
  const LogCapture log;
  const Answer answer =
      AnswerTo("{\"success\": true, \"data\": {\"items\": [1, \"two\", null]}}\n");
  EXPECT_TRUE(answer.done);
  EXPECT_TRUE(answer.out["success"].asBool());
  EXPECT_EQ(answer.out["data"]["items"][1].asString(), "two");
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST(SendWebapi, NamesTheCallInItsFirstArguments) {
  const ScriptedProgram program("echo {}");
  Json::Value out;
  EXPECT_TRUE(SendWebapi(out, "VELK.Sharing.Link", 3, "list", Json::Value(Json::objectValue)));
  ASSERT_THAT(program.calls(), SizeIs(1));
  EXPECT_EQ(program.calls()[0].path, VELK_ROOT "/bin/velkwebapi");
  EXPECT_EQ(program.calls()[0].mode, "r");
  EXPECT_THAT(
      program.calls()[0].arguments,
      ElementsAre("velkwebapi", "--exec", "api=VELK.Sharing.Link", "version=3", "method=list"));
}

TEST(SendWebapi, PassesAnEmptyNameAndAnyVersion) {
  const ScriptedProgram program("echo {}");
  Json::Value out;
  EXPECT_TRUE(SendWebapi(out, "", INT_MIN, "", Json::Value(Json::objectValue)));
  EXPECT_THAT(program.calls().at(0).arguments,
              ElementsAre("velkwebapi", "--exec", "api=", "version=-2147483648", "method="));
}

TEST(SendWebapi, PassesMembersInAscendingOrderOfTheirNames) {
  Json::Value params;
  params["b"] = "1";
  params["a"] = "2";
  params["B"] = "3";
  params["\xc3\xa4"] = "4";
  params[""] = "5";
  EXPECT_THAT(ArgumentsOf(params), ElementsAre("=5", "B=3", "a=2", "b=1", "\xc3\xa4=4"));
}

TEST(SendWebapi, PassesAMemberWithBlanksAndShellCharactersAsOneArgument) {
  const ScriptedProgram program("printf '{\"count\": %d}' $#; printf %s \"$5\" >\"$FOLDER/got\"");
  Json::Value params;
  params["a key"] = "two words; $(exit) \"'\\ *\n=\xff";
  EXPECT_EQ(Ask(params).out["count"].asInt(), 5);
  EXPECT_EQ(velk_test::ReadFile(program.File("got")), "a key=two words; $(exit) \"'\\ *\n=\xff");
}

TEST(SendWebapi, PassesNumbersBooleansAndNullAsText) {
  Json::Value params;
  params["1"] = -5;
  params["2"] = Json::Value::maxLargestUInt;
  params["3"] = 0.5;
  params["4"] = true;
  params["5"] = false;
  params["6"] = Json::Value();
  params["7"] = "";
  EXPECT_THAT(ArgumentsOf(params), ElementsAre("1=-5", "2=18446744073709551615", "3=0.5", "4=true",
                                               "5=false", "6=", "7="));
}

TEST(SendWebapi, TakesNullForNoMembers) {
  EXPECT_THAT(ArgumentsOf(Json::Value()), IsEmpty());
}

TEST(SendWebapi, ThrowsForAMemberThatIsNoTextAndStartsNoProgram) {
  for (const Json::ValueType type : {Json::arrayValue, Json::objectValue}) {
    const ScriptedProgram program("echo {}");
    Json::Value params;
    params["a"] = "text";
    params["b"] = Json::Value(type);
    Json::Value out = "before";
    EXPECT_THROW(SendWebapi(out, "api", 1, "method", params), Json::LogicError);
    EXPECT_THAT(program.calls(), IsEmpty());
    EXPECT_EQ(out, Json::Value(Json::objectValue));
  }
}

TEST(SendWebapi, ThrowsForParametersThatAreNoObjectAndStartsNoProgram) {
  for (const Json::Value &params : {Json::Value("text"), Json::Value(Json::arrayValue)}) {
    const ScriptedProgram program("echo {}");
    Json::Value out;
    EXPECT_THROW(SendWebapi(out, "api", 1, "method", params), Json::LogicError);
    EXPECT_THAT(program.calls(), IsEmpty());
  }
}

TEST(SendWebapi, StartsNoProgramForATextWithAZeroByte) {
  const std::string zero("a\0b", 3);
  Json::Value none(Json::objectValue);
  Json::Value zero_name;
  zero_name[zero] = "text";
  Json::Value zero_value;
  zero_value["name"] = zero;
  const ScriptedProgram program("echo {}");
  const LogCapture log;
  Json::Value out;
  EXPECT_FALSE(SendWebapi(out, zero, 1, "method", none));
  EXPECT_FALSE(SendWebapi(out, "api", 1, zero, none));
  EXPECT_FALSE(SendWebapi(out, "api", 1, "method", zero_name));
  EXPECT_FALSE(SendWebapi(out, "api", 1, "method", zero_value));
  EXPECT_THAT(program.calls(), IsEmpty());
  EXPECT_THAT(log.lines(), SizeIs(8));
}

TEST(SendWebapi, FailsForAMemberThatIsTooLongForAnArgument) {
  const LogCapture log;
  const ScriptedProgram program("echo {}");
  Json::Value params;
  params["text"] = std::string(10u << 20, 'x');
  EXPECT_FALSE(Ask(params).done);
  EXPECT_THAT(log.lines(), SizeIs(2));
}

TEST(SendWebapi, PassesAThousandMembers) {
  Json::Value params;
  for (int i = 0; i < 1000; ++i) params["name" + std::to_string(i)] = i;
  EXPECT_THAT(ArgumentsOf(params), SizeIs(1000));
}

TEST(SendWebapi, LogsThatTheProgramCannotBeStarted) {
  const LogCapture log;
  const ScriptedProgram program("");
  ASSERT_EQ(remove(program.path().c_str()), 0);
  const Answer answer = Ask();
  EXPECT_FALSE(answer.done);
  EXPECT_EQ(answer.out, Json::Value(Json::objectValue));
  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) VLIBCPopenv failed.\n",
                                    "include/internal/popen:# (@) VLIBCPopenv failed.\n"),
                          ErrorLine("%s:%d (%u) popen failed\n\n",
                                    "utils_send_webapi:# (@) popen failed\n\n")));
}

TEST(SendWebapi, TakesNoOutputForNoJson) {
  const LogCapture log;
  EXPECT_FALSE(AnswerTo("").done);
  EXPECT_THAT(log.lines(), ElementsAre(JsonReadFailed()));
}

TEST(SendWebapi, LogsOutputThatIsNoJson) {
  for (const char *const output :
       {"velkwebapi: no such API\n", "{", "{\"a\": }", "[1, 2", "\"", "\xff\xfe", "{'a': 1}"}) {
    const LogCapture log;
    EXPECT_FALSE(AnswerTo(output).done) << output;
    EXPECT_THAT(log.lines(), ElementsAre(JsonReadFailed())) << output;
  }
}

TEST(SendWebapi, TakesJsonThatIsNestedTooDeepForNoJson) {
  const LogCapture log;
  EXPECT_FALSE(AnswerTo(std::string(100000, '[')).done);
  EXPECT_FALSE(AnswerTo(std::string(5000, '[') + std::string(5000, ']')).done);
  EXPECT_THAT(log.lines(), ElementsAre(JsonReadFailed(), JsonReadFailed()));
}

TEST(SendWebapi, GivesAnswersThatReportAnError) {
  const Answer answer = AnswerTo("{\"success\": false, \"error\": {\"code\": 101}}");
  EXPECT_TRUE(answer.done);
  EXPECT_EQ(answer.out["error"]["code"].asInt(), 101);
}

TEST(SendWebapi, GivesDocumentsThatAreNoObjects) {
  EXPECT_EQ(AnswerTo("[1, 2]").out.size(), 2u);
  EXPECT_EQ(AnswerTo(" 42 ").out.asInt(), 42);
  EXPECT_TRUE(AnswerTo("null").done);
}

TEST(SendWebapi, DoesNotCollectComments) {
  const Answer answer = AnswerTo("// before\n{\"a\": 1} // behind\n");
  EXPECT_TRUE(answer.done);
  EXPECT_EQ(answer.out["a"].asInt(), 1);
  EXPECT_FALSE(answer.out.hasComment(Json::commentBefore));
}

TEST(SendWebapi, RefusesZeroBytesBetweenValuesAndKeepsThemInTexts) {
  const LogCapture log;
  EXPECT_FALSE(AnswerTo(std::string("{\0}", 3)).done);
  EXPECT_EQ(AnswerTo(std::string("\"a\0b\"", 5)).out.asString(), std::string("a\0b", 3));
}

TEST(SendWebapi, PutsTogetherAnswersOfEveryLengthAroundAChunk) {
  for (const size_t length : {4095u, 4096u, 4097u, 8192u, 70000u}) {
    const std::string text(length - 2, 'x');
    EXPECT_EQ(AnswerTo("\"" + text + "\"").out.asString(), text);
  }
}

TEST(SendWebapi, ReadsAnAnswerOfOneHundredMegabytes) {
  const ScriptedProgram program(
      "printf '\"'; head -c 100000000 /dev/zero | tr '\\0' x; printf '\"'");
  const Answer answer = Ask();
  EXPECT_TRUE(answer.done);
  EXPECT_TRUE(answer.out.asString() == std::string(100000000, 'x'));
}

TEST(SendWebapi, DoesNotLookAtTheExitStatus) {
  const LogCapture log;
  const ScriptedProgram program("echo '{\"a\": 1}'; exit 2");
  const Answer answer = Ask();
  EXPECT_TRUE(answer.done);
  EXPECT_EQ(answer.out["a"].asInt(), 1);
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST(SendWebapi, ReplacesWhatTheAnswerHeldBefore) {
  const ScriptedProgram program("echo '{\"new\": 1}'");
  Json::Value out;
  out["old"] = 1;
  EXPECT_TRUE(SendWebapi(out, "api", 1, "method", Json::Value(Json::objectValue)));
  EXPECT_THAT(out.getMemberNames(), ElementsAre("new"));
}

}  // namespace
