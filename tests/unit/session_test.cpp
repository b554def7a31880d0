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
using VELK::sharing::UID_ERR;
using VELK::sharing::record::Object;
using velk_test::FailedConditionAt;
using velk_test::LogCapture;
using velk_test::SampleRow;
using velk_test::SampleSession;

using SessionRecord = VELK::sharing::record::Session;

SessionRecord Filled() {
  SessionRecord session;
  session.set_id(5).set_session_id("secret").set_uid(1026).set_ip("192.0.2.1");
  session.set_timeout(1700000000);
  return session;
}

TEST(Session, IsEmptyByDefault) {
  const SessionRecord session;
  EXPECT_EQ(0, session.get_id());
  EXPECT_EQ("", session.get_session_id());
  EXPECT_EQ(4294967295u, session.get_uid());
  EXPECT_EQ("", session.get_ip());
  EXPECT_EQ(0, session.get_timeout());
}

TEST(Session, SettersChainAndKeepTheirValues) {
  SessionRecord session;
  EXPECT_EQ(&session,
            &session.set_id(1).set_session_id("s").set_uid(2).set_ip("::1").set_timeout(3));
  EXPECT_EQ(1, session.get_id());
  EXPECT_EQ("s", session.get_session_id());
  EXPECT_EQ(2u, session.get_uid());
  EXPECT_EQ("::1", session.get_ip());
  EXPECT_EQ(3, session.get_timeout());
}

TEST(Session, ListsItsColumnsInTheTablesOrder) {
  EXPECT_THAT(Filled().GetFieldList(), ElementsAre("secret", "1026", "192.0.2.1", "1700000000"));
}

TEST(Session, WritesNoAccountAsAnUnsignedNumber) {
  EXPECT_EQ("4294967295", SessionRecord().GetFieldList().at(1));
}

TEST(Session, NamesItsColumns) {
  const std::map<std::string, std::string> expected = {
      {"session_id", "secret"}, {"uid", "1026"}, {"ip", "192.0.2.1"}, {"timeout", "1700000000"}};
  EXPECT_EQ(expected, Filled().GetFieldMap());
}

TEST(Session, IsIllegalWithoutAnIdentifier) {
  const LogCapture log;
  EXPECT_FALSE(SessionRecord().IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("session", 87, "\"\" == session_id_")));
}

TEST(Session, IsIllegalWithoutAnAddress) {
  const LogCapture log;
  EXPECT_FALSE(SessionRecord().set_session_id("s").IsLegal());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("session", 88, "\"\" == ip_")));
}

TEST(Session, IsIllegalFromTheSecondOfItsTimeOutOn) {
  for (const long before : {0L, 1L, 1000000L}) {
    const LogCapture log;
    EXPECT_FALSE(SampleSession("s").set_timeout(time(nullptr) - before).IsLegal());
    EXPECT_THAT(log.lines(),
                ElementsAre(FailedConditionAt("session", 89, "time(NULL) >= timeout_")));
  }
}

TEST(Session, IsLegalWithoutAnAccount) {
  const LogCapture log;
  EXPECT_TRUE(SampleSession("s").set_uid(UID_ERR).IsLegal());
  EXPECT_TRUE(SampleSession("s").set_timeout(LONG_MAX).IsLegal());
  EXPECT_TRUE(log.lines().empty());
}

TEST(Session, WritesItsJsonWithoutTheId) {
  Json::Value json;
  Filled().ToJSON(json);
  EXPECT_THAT(json.getMemberNames(), ElementsAre("ip", "session_id", "timeout", "uid"));
  EXPECT_EQ("secret", json["session_id"].asString());
  EXPECT_EQ(1026u, json["uid"].asUInt());
  EXPECT_EQ("192.0.2.1", json["ip"].asString());
  EXPECT_EQ(1700000000, json["timeout"].asInt64());
}

TEST(Session, WritesNoAccountAsAnUnsignedJsonNumber) {
  Json::Value json;
  SessionRecord().ToJSON(json);
  EXPECT_EQ(4294967295u, json["uid"].asUInt());
  EXPECT_TRUE(json["uid"].isUInt());
}

TEST(Session, MakesAnObjectOfWhatIsNone) {
  Json::Value json(Json::arrayValue);
  Filled().ToJSON(json);
  EXPECT_TRUE(json.isObject());
}

TEST(Session, LeavesOtherMembersOfTheJsonAlone) {
  Json::Value json;
  json["other"] = "kept";
  Filled().ToJSON(json);
  EXPECT_EQ("kept", json["other"].asString());
}

TEST(Session, LoadsFromARow) {
  const long timeout = time(nullptr) + 60;
  const SampleRow row({{"id", "5"},
                       {"session_id", "secret"},
                       {"uid", "4294967295"},
                       {"ip", "2001:db8::1"},
                       {"timeout", std::to_string(timeout)}});
  SessionRecord session;
  EXPECT_TRUE(session.FromRow(row.row()));
  EXPECT_EQ(5, session.get_id());
  EXPECT_EQ("secret", session.get_session_id());
  EXPECT_EQ(UID_ERR, session.get_uid());
  EXPECT_EQ("2001:db8::1", session.get_ip());
  EXPECT_EQ(timeout, session.get_timeout());
}

TEST(Session, LoadsALapsedRowInFullAndRefusesIt) {
  const SampleRow row({{"id", "5"},
                       {"session_id", "secret"},
                       {"uid", "1026"},
                       {"ip", "192.0.2.1"},
                       {"timeout", "1000"}});
  const LogCapture log;
  SessionRecord session;
  EXPECT_FALSE(session.FromRow(row.row()));
  EXPECT_EQ(5, session.get_id());
  EXPECT_EQ("secret", session.get_session_id());
  EXPECT_EQ(1026u, session.get_uid());
  EXPECT_EQ("192.0.2.1", session.get_ip());
  EXPECT_EQ(1000, session.get_timeout());
  EXPECT_THAT(log.lines(), ElementsAre(FailedConditionAt("session", 89, "time(NULL) >= timeout_")));
}

TEST(Session, LoadsAMissingAccountAsZero) {
  const SampleRow row({{"id", "x"}, {"timeout", "y"}});
  const LogCapture log;
  SessionRecord session = Filled();
  EXPECT_FALSE(session.FromRow(row.row()));
  EXPECT_EQ(0, session.get_id());
  EXPECT_EQ("", session.get_session_id());
  EXPECT_EQ(0u, session.get_uid());
  EXPECT_EQ("", session.get_ip());
  EXPECT_EQ(0, session.get_timeout());
}

TEST(Session, IsTheObjectThatItHandsOut) {
  SessionRecord session = SampleSession("s");
  Object &object = session.GetObject();
  EXPECT_EQ(&object, &session.GetCObject());
  EXPECT_EQ(session.GetFieldList(), object.GetFieldList());
  EXPECT_EQ(session.GetFieldMap(), object.GetFieldMap());
  EXPECT_TRUE(object.IsLegal());
  object.set_id(33);
  EXPECT_EQ(33, session.get_id());
}

TEST(Session, CopiesAreIndependent) {
  SessionRecord session = Filled();
  SessionRecord copy(session);
  SessionRecord assigned;
  assigned = session;
  for (SessionRecord *other : {&copy, &assigned}) {
    EXPECT_EQ(5, other->get_id());
    EXPECT_EQ(session.GetFieldList(), other->GetFieldList());
    other->set_session_id("other").set_ip("other");
    EXPECT_EQ("secret", session.get_session_id());
    EXPECT_EQ("192.0.2.1", session.get_ip());
  }
}

TEST(Session, MoveConstructionTakesTheTextsAndCopiesTheNumbers) {
  SessionRecord session = Filled();
  const SessionRecord moved(std::move(session));

  EXPECT_EQ(5, moved.get_id());
  EXPECT_EQ(Filled().GetFieldList(), moved.GetFieldList());
  EXPECT_EQ("", session.get_session_id());
  EXPECT_EQ("", session.get_ip());
  EXPECT_EQ(5, session.get_id());
  EXPECT_EQ(1026u, session.get_uid());
  EXPECT_EQ(1700000000, session.get_timeout());
}

TEST(Session, MoveAssignmentSwapsTheTextsAndCopiesTheNumbers) {
  SessionRecord session = Filled();
  SessionRecord target;
  target.set_id(77).set_session_id("old").set_ip("old ip").set_uid(3).set_timeout(4);
  target = std::move(session);

  EXPECT_EQ(5, target.get_id());
  EXPECT_EQ(Filled().GetFieldList(), target.GetFieldList());
  EXPECT_EQ("old", session.get_session_id());
  EXPECT_EQ("old ip", session.get_ip());
  EXPECT_EQ(5, session.get_id());
  EXPECT_EQ(1026u, session.get_uid());
  EXPECT_EQ(1700000000, session.get_timeout());
}

TEST(Session, StaysUsableAfterAMove) {
  SessionRecord session = SampleSession("s");
  const SessionRecord moved(std::move(session));
  session.set_session_id("again").set_ip("192.0.2.9");
  EXPECT_TRUE(session.IsLegal());
  EXPECT_EQ("s", moved.get_session_id());
}

TEST(Session, SurvivesAssignmentToItself) {
  SessionRecord session = Filled();
  SessionRecord &same = session;
  session = same;
  session = std::move(same);
  EXPECT_EQ(Filled().GetFieldList(), session.GetFieldList());
}

}  // namespace
