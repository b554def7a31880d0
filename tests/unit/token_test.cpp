#include <gtest/gtest.h>
#include <velksharing/constants.h>
#include <velksharing/record.h>

#include <climits>
#include <utility>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/sample_records.h"

namespace {

using ::testing::ElementsAre;
using VELK::sharing::record::Object;
using velk_test::FailedConditionAt;
using velk_test::LogCapture;
using velk_test::SampleRow;
using velk_test::SampleToken;

using TokenRecord = VELK::sharing::record::Token;

TEST(Token, IsEmptyByDefault) {
  const TokenRecord token;
  EXPECT_EQ(0, token.get_id());
  EXPECT_EQ(0, token.get_entry_id());
  EXPECT_EQ(0, token.get_session_id());
  EXPECT_EQ(0, token.get_timeout());
}

TEST(Token, SettersChainAndKeepTheirValues) {
  TokenRecord token;
  EXPECT_EQ(&token, &token.set_id(1).set_entry_id(2).set_session_id(3).set_timeout(4));
  EXPECT_EQ(1, token.get_id());
  EXPECT_EQ(2, token.get_entry_id());
  EXPECT_EQ(3, token.get_session_id());
  EXPECT_EQ(4, token.get_timeout());
}

TEST(Token, ListsItsColumnsInTheTablesOrder) {
  TokenRecord token;
  token.set_id(9).set_entry_id(-7).set_session_id(12).set_timeout(1700000000);
  EXPECT_THAT(token.GetFieldList(), ElementsAre("-7", "12", "1700000000"));
}

TEST(Token, NamesItsColumns) {
  TokenRecord token;
  token.set_entry_id(7).set_session_id(12).set_timeout(-1);
  const std::map<std::string, std::string> expected = {
      {"entry_id", "7"}, {"session_id", "12"}, {"timeout", "-1"}};
  EXPECT_EQ(expected, token.GetFieldMap());
}

TEST(Token, IsIllegalWithoutAnEntry) {
  const LogCapture log;
  EXPECT_FALSE(TokenRecord().IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("token", 81, "0 == entry_id_")));
}

TEST(Token, IsIllegalWithoutASession) {
  const LogCapture log;
  EXPECT_FALSE(TokenRecord().set_entry_id(1).IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("token", 82, "0 == session_id_")));
}

TEST(Token, IsIllegalFromTheSecondOfItsTimeOutOn) {
  for (const long before : {0L, 1L, 1000000L}) {
    const LogCapture log;
    EXPECT_FALSE(SampleToken(1, 1).set_timeout(time(nullptr) - before).IsLegal());
    EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("token", 83, "time(NULL) >= timeout_")));
  }
}

TEST(Token, IsLegalUntilItsTimeOut) {
  const LogCapture log;
  EXPECT_TRUE(SampleToken(1, 1).set_timeout(time(nullptr) + 60).IsLegal());
  EXPECT_TRUE(SampleToken(1, 1).set_timeout(LONG_MAX).IsLegal());
  EXPECT_TRUE(log.lines().empty());
}

TEST(Token, IsLegalWithNegativeIds) {
  EXPECT_TRUE(SampleToken(-1, -1).IsLegal());
}

TEST(Token, WritesItsJsonWithoutTheId) {
  TokenRecord token;
  token.set_id(9).set_entry_id(7).set_session_id(12).set_timeout(1700000000);
  Json::Value json;
  token.ToJSON(json);
  EXPECT_THAT(json.getMemberNames(), ElementsAre("entry_id", "session_id", "timeout"));
  EXPECT_EQ(7, json["entry_id"].asInt());
  EXPECT_EQ(12, json["session_id"].asInt());
  EXPECT_EQ(1700000000, json["timeout"].asInt64());
  EXPECT_TRUE(json["timeout"].isIntegral());
}

TEST(Token, WritesTimesAfter2038) {
  Json::Value json;
  TokenRecord().set_timeout(5000000000L).ToJSON(json);
  EXPECT_EQ(5000000000LL, json["timeout"].asInt64());
}

TEST(Token, MakesAnObjectOfWhatIsNone) {
  Json::Value json("text");
  TokenRecord().ToJSON(json);
  EXPECT_TRUE(json.isObject());
}

TEST(Token, LeavesOtherMembersOfTheJsonAlone) {
  Json::Value json;
  json["other"] = "kept";
  TokenRecord().ToJSON(json);
  EXPECT_EQ("kept", json["other"].asString());
}

TEST(Token, LoadsFromARow) {
  const long timeout = time(nullptr) + 60;
  const SampleRow row(
      {{"id", "5"}, {"entry_id", "7"}, {"session_id", "12"}, {"timeout", std::to_string(timeout)}});
  TokenRecord token;
  EXPECT_TRUE(token.FromRow(row.row()));
  EXPECT_EQ(5, token.get_id());
  EXPECT_EQ(7, token.get_entry_id());
  EXPECT_EQ(12, token.get_session_id());
  EXPECT_EQ(timeout, token.get_timeout());
}

TEST(Token, LoadsALapsedRowInFullAndRefusesIt) {
  const SampleRow row({{"id", "5"}, {"entry_id", "7"}, {"session_id", "12"}, {"timeout", "1000"}});
  const LogCapture log;
  TokenRecord token;
  EXPECT_FALSE(token.FromRow(row.row()));
  EXPECT_EQ(5, token.get_id());
  EXPECT_EQ(7, token.get_entry_id());
  EXPECT_EQ(12, token.get_session_id());
  EXPECT_EQ(1000, token.get_timeout());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("token", 83, "time(NULL) >= timeout_")));
}

TEST(Token, LoadsZerosFromColumnsThatAreMissingOrNoNumbers) {
  const SampleRow row({{"id", "x"}, {"entry_id", "y"}, {"timeout", "z"}});
  const LogCapture log;
  TokenRecord token = SampleToken(1, 2);
  token.set_id(3);
  EXPECT_FALSE(token.FromRow(row.row()));
  EXPECT_EQ(0, token.get_id());
  EXPECT_EQ(0, token.get_entry_id());
  EXPECT_EQ(0, token.get_session_id());
  EXPECT_EQ(0, token.get_timeout());
}

TEST(Token, IsTheObjectThatItHandsOut) {
  TokenRecord token = SampleToken(12, 7);
  Object &object = token.GetObject();
  EXPECT_EQ(&object, &token.GetCObject());
  EXPECT_EQ(token.GetFieldList(), object.GetFieldList());
  EXPECT_EQ(token.GetFieldMap(), object.GetFieldMap());
  EXPECT_TRUE(object.IsLegal());
  object.set_id(33);
  EXPECT_EQ(33, token.get_id());
  EXPECT_EQ(33, object.get_id());
}

TEST(Token, CopiesAreIndependent) {
  TokenRecord token = SampleToken(12, 7);
  token.set_id(5);
  TokenRecord copy(token);
  TokenRecord assigned;
  assigned = token;
  for (TokenRecord *other : {&copy, &assigned}) {
    EXPECT_EQ(5, other->get_id());
    EXPECT_EQ(token.GetFieldList(), other->GetFieldList());
    EXPECT_NE(&token.GetObject(), &other->GetObject());
    other->set_session_id(99);
    EXPECT_EQ(12, token.get_session_id());
  }
}

TEST(Token, MovesCopyItsNumbers) {
  TokenRecord token = SampleToken(12, 7);
  token.set_id(5);
  const TokenRecord moved(std::move(token));
  EXPECT_EQ(5, moved.get_id());
  EXPECT_EQ(7, moved.get_entry_id());
  EXPECT_EQ(5, token.get_id());
  EXPECT_EQ(12, token.get_session_id());

  TokenRecord assigned;
  assigned = std::move(token);
  EXPECT_EQ(5, assigned.get_id());
  EXPECT_EQ(7, token.get_entry_id());
  EXPECT_TRUE(token.IsLegal());
}

TEST(Token, SurvivesAssignmentToItself) {
  TokenRecord token = SampleToken(12, 7);
  TokenRecord &same = token;
  token = same;
  token = std::move(same);
  EXPECT_EQ(12, token.get_session_id());
  EXPECT_EQ(7, token.get_entry_id());
}

}  // namespace
