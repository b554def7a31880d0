#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <pwd.h>
#include <sys/types.h>
#include <unistd.h>
#include <velk/velksdk.h>
#include <velksharing/utils.h>

#include <set>
#include <string>

#include "support/log_capture.h"
#include "support/log_matcher.h"

namespace {

using namespace VELK::sharing;
using ::testing::ElementsAre;
using velk_test::ErrorLine;
using velk_test::LogCapture;

const char *const unknown_user = "velk-no-such-user";
constexpr unsigned int unknown_id = 3999999999u;

TEST(GetRealUsername, GivesTheAccountsOwnSpelling) {
  EXPECT_EQ("root", GetRealUsername("root"));
  EXPECT_EQ("root", GetRealUsername("  root "));
  EXPECT_EQ("root", GetRealUsername("ROOT"));
}

TEST(GetRealUsername, GivesAnUnknownNameAsItIs) {
  EXPECT_EQ(unknown_user, GetRealUsername(unknown_user));
  EXPECT_EQ("", GetRealUsername(""));
}

TEST(GetRealUsername, GivesNothingForNull) {
  EXPECT_EQ("", GetRealUsername(nullptr));
}

TEST(GetRealUsername, GivesNothingForADomainAccountThatCannotBeFound) {
  EXPECT_EQ("", GetRealUsername("EXAMPLE\\velk-no-such-user"));
  EXPECT_EQ("", GetRealUsername("\\"));
}

TEST(GetRealUsername, CutsLongNames) {
  EXPECT_EQ(std::string(492, 'x'), GetRealUsername(std::string(492, 'x').c_str()));
  EXPECT_EQ(std::string(492, 'x'), GetRealUsername(std::string(493, 'x').c_str()));
  EXPECT_EQ(std::string(492, 'x'), GetRealUsername(std::string(10u << 20, 'x').c_str()));
}

TEST(UserGet, FindsAnAccountByATypedName) {
  VELKUSER *user = nullptr;
  ASSERT_TRUE(UserGet(" Root", user));
  EXPECT_STREQ("root", user->name);
  EXPECT_EQ(0u, user->uid);
  VELKUserFree(user);
}

TEST(UserGet, LogsAnUnknownName) {
  const LogCapture log;
  VELKUSER *user = nullptr;
  EXPECT_FALSE(UserGet(unknown_user, user));
  EXPECT_EQ(nullptr, user);
  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d No such user [%s]",
                                    "utils_user_group:# No such user [velk-no-such-user]")));
}

TEST(UserGet, RefusesNull) {
  const LogCapture log;
  VELKUSER *user = nullptr;
  EXPECT_FALSE(UserGet(nullptr, user));
  EXPECT_THAT(log.lines(), ElementsAre(ErrorLine("%s:%d No such user [%s]",
                                                 "utils_user_group:# No such user []")));
}

TEST(UserToUid, FindsAnAccountByATypedName) {
  unsigned int uid = 77;
  EXPECT_TRUE(UserToUID("root", uid));
  EXPECT_EQ(0u, uid);
}

TEST(UserToUid, LeavesTheIdAloneForAnUnknownName) {
  const LogCapture log;
  for (const std::string name : {"velk-no-such-user", "", "EXAMPLE\\nobody-here"}) {
    unsigned int uid = 77;
    EXPECT_FALSE(UserToUID(name, uid)) << name;
    EXPECT_EQ(77u, uid);
  }
  EXPECT_TRUE(log.lines().empty());
}

TEST(UserToUid, DoesNotTakeTheStartOfANameWithAZeroByteForTheName) {
  unsigned int uid = 77;
  EXPECT_FALSE(UserToUID(std::string("root\0x", 6), uid));
  EXPECT_EQ(77u, uid);
}

TEST(UidToUser, FindsTheNameOfAnAccount) {
  std::string name;
  EXPECT_TRUE(UIDToUser(0, name));
  EXPECT_EQ("root", name);
}

TEST(UidToUser, LeavesTheNameAloneForAnUnknownId) {
  std::string name = "before";
  EXPECT_FALSE(UIDToUser(unknown_id, name));
  EXPECT_FALSE(UIDToUser(4294967295u, name));
  EXPECT_EQ("before", name);
}

TEST(GroupToGid, FindsTheIdOfAGroup) {
  unsigned int gid = 77;
  EXPECT_TRUE(GroupToGID("root", gid));
  EXPECT_EQ(0u, gid);
}

TEST(UserToUid, KnowsNoNameOfTenMegabytes) {
  unsigned int uid = 77;
  EXPECT_FALSE(UserToUID(std::string(10u << 20, 'x'), uid));
  EXPECT_EQ(77u, uid);
}

TEST(GroupToGid, KnowsNoNameOfTenMegabytes) {
  unsigned int gid = 77;
  EXPECT_FALSE(GroupToGID(std::string(10u << 20, 'x'), gid));
  EXPECT_EQ(77u, gid);
}

TEST(GroupToGid, LeavesTheIdAloneForAnUnknownName) {
  unsigned int gid = 77;
  EXPECT_FALSE(GroupToGID("velk-no-such-group", gid));
  EXPECT_FALSE(GroupToGID("", gid));
  EXPECT_EQ(77u, gid);
}

TEST(GroupToGid, DoesNotTakeTheStartOfANameWithAZeroByteForTheName) {
  unsigned int gid = 77;
  EXPECT_FALSE(GroupToGID(std::string("root\0x", 6), gid));
  EXPECT_EQ(77u, gid);
}

TEST(GidToGroup, FindsTheNameOfAGroup) {
  std::string name;
  EXPECT_TRUE(GIDToGroup(0, name));
  EXPECT_EQ("root", name);
}

TEST(GidToGroup, LeavesTheNameAloneForAnUnknownId) {
  std::string name = "before";
  EXPECT_FALSE(GIDToGroup(unknown_id, name));
  EXPECT_EQ("before", name);
}

TEST(UserGroupsGet, AddsTheGroupsOfTheAccountToTheSet) {
  VELKUSER *user = nullptr;
  ASSERT_TRUE(UserGet("root", user));
  std::set<unsigned int> gids = {unknown_id};
  EXPECT_TRUE(UserGroupsGet(user, gids));
  VELKUserFree(user);
  EXPECT_EQ(1u, gids.count(0)) << "the primary group";
  EXPECT_EQ(1u, gids.count(unknown_id)) << "what was there before";
}

TEST(UserGroupsGet, RefusesNullAndAnUnknownAccount) {
  std::set<unsigned int> gids = {5};
  EXPECT_FALSE(UserGroupsGet(nullptr, gids));
  VELKUSER user = {};
  std::string name = unknown_user;
  user.name = name.data();
  EXPECT_FALSE(UserGroupsGet(&user, gids));
  EXPECT_THAT(gids, ElementsAre(5u));
}

}  // namespace
